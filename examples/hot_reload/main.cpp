// Runs a kernel that may be edited while it runs: prints the height that it computes whenever the
// file changes, and continues with the last good kernel if the new text does not compile.
//
//   hot-reload DIRECTORY SECONDS     DIRECTORY holds ripple.cl
#include "evaluator/Evaluator.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/GLHost.h"
#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"

#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>

namespace {

using Clock = std::chrono::steady_clock;

class RippleDeformer : public vyra::Deformer {
public:
    float time = 0; // seconds

    const char* name() const override { return "ripple"; }
    vyra::KernelSource kernel(unsigned /*pass*/) const override { return {"ripple.cl", "ripple"}; }
    void setArguments(unsigned /*pass*/, vyra::KernelArguments& arguments) override
    {
        arguments.value(time);
    }
    // No CPU version: the kernel is still being developed.
    void deform(const vyra::MeshGeometry& /*geometry*/, vyra::Surface& /*surface*/) const override
    {
    }
};

std::string readFile(const std::filesystem::path& path)
{
    std::ostringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
}

float heightOfFirstVertex(QOpenGLExtraFunctions& gl, unsigned buffer)
{
    gl.glBindBuffer(GL_ARRAY_BUFFER, buffer);
    const auto* vertex = static_cast<const vyra::Vector3*>(
        gl.glMapBufferRange(GL_ARRAY_BUFFER, 0, sizeof(vyra::Vector3), GL_MAP_READ_BIT));
    const float height = vertex ? vertex->y : 0.0F;
    gl.glUnmapBuffer(GL_ARRAY_BUFFER);
    return height;
}

} // namespace

int main(int argc, char** argv)
{
    if (argc != 3)
        return std::fprintf(stderr, "usage: hot-reload DIRECTORY SECONDS\n"), 2;
    const std::filesystem::path file = std::filesystem::path(argv[1]) / "ripple.cl";
    const auto end = Clock::now() + std::chrono::seconds(std::atoi(argv[2]));

    QGuiApplication application(argc, argv);
    QOffscreenSurface surface;
    surface.create();
    QOpenGLContext context;
    if (!context.create() || !context.makeCurrent(&surface))
        return std::fprintf(stderr, "There is no OpenGL: run this on a display.\n"), 1;
    QOpenGLExtraFunctions& gl = *context.extraFunctions();
    const GLHost host(context);
    TopenCLInfo::initialize(nullptr, nativeContext(context), nullptr, false, true,
                            chooseOpenCLPlatform(context));

    vyra::EvaluatorSettings settings;
    settings.finishRenderer = [&gl] { gl.glFinish(); };
    settings.kernelDirectories = {argv[1]};
    vyra::Evaluator evaluator(settings);
    auto geometry = std::make_shared<vyra::MeshGeometry>();
    geometry->name = "points";
    geometry->rest.positions.resize(4096);
    geometry->rest.normals.resize(4096, {0, 1, 0});
    const auto bytes = static_cast<GLsizeiptr>(4096 * sizeof(vyra::Vector3));
    unsigned buffers[2] = {};
    gl.glGenBuffers(2, buffers);
    for (const unsigned buffer : buffers) {
        gl.glBindBuffer(GL_ARRAY_BUFFER, buffer);
        gl.glBufferData(GL_ARRAY_BUFFER, bytes, geometry->rest.positions.data(), GL_DYNAMIC_DRAW);
    }
    vyra::DeformableMesh& mesh = evaluator.createMesh(geometry, {buffers[0], buffers[1]});
    mesh.add<RippleDeformer>();
    if (const vyra::Status status = evaluator.prepare(); !status.ok())
        return std::fprintf(stderr, "%s\n", status.message.c_str()), 1;
    if (!mesh.usesOpenCL())
        return std::fprintf(stderr, "OpenCL is off; the lines above name the reason.\n"), 1;

    std::string text = readFile(file);
    bool changed = true;
    for (std::uint16_t frame = 0; Clock::now() < end; frame = (frame + 1U) & 0x7fff) {
        if (std::string now = readFile(file); now != text) {
            text = std::move(now);
            const vyra::Status status = evaluator.replaceKernelFile("ripple.cl", text);
            changed = status.ok();
            if (!changed)
                std::printf("continuing with the last good kernel: %s\n", status.message.c_str());
        }
        evaluator.evaluate(em::Id(frame));
        evaluator.waitUntilDrawable();
        if (changed)
            std::printf("height %g\n", static_cast<double>(heightOfFirstVertex(gl, buffers[0])));
        changed = false;
        std::fflush(stdout);
        evaluator.renderingComplete();
        std::this_thread::sleep_for(std::chrono::milliseconds(30));
    }
    return evaluator.status().ok() ? 0 : 1;
}
