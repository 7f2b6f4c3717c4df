#include "Way.h"

#include "viewer/Evaluation.h"

#include <stdexcept>

namespace {

void require(const viewer::Status& failure)
{
    if (failure)
        throw std::runtime_error(failure->text);
}

class SharedWay : public Way {
public:
    SharedWay(QOpenGLFunctions_3_3_Core& gl, const viewer::OpenCLFunctions& cl,
              viewer::Scene& scene)
        : fEvaluation(gl, cl, scene)
    {
        for (viewer::CharacterMesh* mesh : scene.meshes())
            require(fEvaluation.adopt(*mesh));
    }

    const char* name() const override { return "shared"; }

    void deform() override
    {
        require(fEvaluation.evaluate(em::Id(fFrame), [] { return viewer::Status(); }));
        fEvaluation.waitUntilDrawable();
        fFrame = static_cast<std::uint16_t>((fFrame + 1) % kEvaluationNumbers);
    }

    void drawn() override { fEvaluation.renderingComplete(); }

private:
    // Evaluations are numbered in 15 bits, one number names none.
    static constexpr std::uint16_t kEvaluationNumbers = 0x7fff;

    viewer::Evaluation fEvaluation;
    std::uint16_t fFrame = 0;
};

} // namespace

std::unique_ptr<Way> makeSharedWay(QOpenGLFunctions_3_3_Core& gl, const viewer::OpenCLFunctions& cl,
                                   viewer::Scene& scene)
{
    return std::make_unique<SharedWay>(gl, cl, scene);
}
