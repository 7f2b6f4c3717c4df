#include "frames/Path.h"

#include "host/EvaluationId.h"

#include <stdexcept>

namespace {

class SharedBufferPath : public Path {
public:
    explicit SharedBufferPath(vyra::Evaluator& evaluator) : fEvaluator(evaluator)
    {
        require(fEvaluator.prepare());
    }

    void deform() override
    {
        fEvaluator.evaluate(em::Id(fFrame));
        require(fEvaluator.status());
        fEvaluator.waitUntilDrawable();
        fFrame = static_cast<std::uint16_t>((fFrame + 1) % kEvaluationNumbers);
    }

    void drawn() override { fEvaluator.renderingComplete(); }

private:
    // The ids of evaluations have 15 bits; the highest value means no evaluation.
    static constexpr std::uint16_t kEvaluationNumbers = 0x7fff;

    static void require(const vyra::Status& status)
    {
        if (!status.ok())
            throw std::runtime_error(status.message);
    }

    vyra::Evaluator& fEvaluator;
    std::uint16_t fFrame = 0;
};

} // namespace

std::unique_ptr<Path> makeSharedBufferPath(vyra::Evaluator& evaluator)
{
    return std::make_unique<SharedBufferPath>(evaluator);
}
