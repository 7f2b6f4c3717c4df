// Deforms a mesh with a deformer of its own, and compares the result with the CPU.
#include "TaperDeformer.h"
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
#include <cmath>
#include <cstdio>

namespace {

// A cylinder of height 1 without caps.
vyra::MeshGeometry cylinder(std::size_t rings, std::size_t sides)
{
    vyra::MeshGeometry geometry;
    geometry.name = "cylinder";
    for (std::size_t i = 0; i < rings * sides; ++i) {
        const float angle = 6.2831853F * static_cast<float>(i % sides) / static_cast<float>(sides);
        const std::size_t ring = i / sides;
        const float y = static_cast<float>(ring) / static_cast<float>(rings - 1);
        geometry.rest.positions.push_back({std::cos(angle), y, std::sin(angle)});
        geometry.rest.normals.push_back({std::cos(angle), 0, std::sin(angle)});
    }
    return geometry;
}

unsigned makeVertexBuffer(QOpenGLExtraFunctions& gl, const std::vector<vyra::Vector3>& contents)
{
    unsigned buffer = 0;
    gl.glGenBuffers(1, &buffer);
    gl.glBindBuffer(GL_ARRAY_BUFFER, buffer);
    gl.glBufferData(GL_ARRAY_BUFFER,
                    static_cast<GLsizeiptr>(contents.size() * sizeof(vyra::Vector3)),
                    contents.data(), GL_DYNAMIC_DRAW);
    return buffer;
}

// The largest difference of two coordinates.
float difference(QOpenGLExtraFunctions& gl, unsigned buffer,
                 const std::vector<vyra::Vector3>& expected)
{
    const std::size_t bytes = expected.size() * sizeof(vyra::Vector3);
    gl.glBindBuffer(GL_ARRAY_BUFFER, buffer);
    const auto* drawn = static_cast<const vyra::Vector3*>(
        gl.glMapBufferRange(GL_ARRAY_BUFFER, 0, static_cast<GLsizeiptr>(bytes), GL_MAP_READ_BIT));
    float largest = drawn ? 0.0F : INFINITY;
    for (std::size_t i = 0; drawn && i < expected.size(); ++i)
        largest =
            std::max({largest, std::abs(drawn[i].x - expected[i].x),
                      std::abs(drawn[i].y - expected[i].y), std::abs(drawn[i].z - expected[i].z)});
    gl.glUnmapBuffer(GL_ARRAY_BUFFER);
    return largest;
}

} // namespace

int main(int argc, char** argv)
{
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

    // The evaluator looks for taper.cl in the directory of this program's sources.
    vyra::EvaluatorSettings settings;
    settings.finishRenderer = [&gl] { gl.glFinish(); };
    settings.kernelDirectories = {EXAMPLE_KERNELS};
    vyra::Evaluator evaluator(settings);

    const auto geometry = std::make_shared<const vyra::MeshGeometry>(cylinder(64, 64));
    const unsigned positions = makeVertexBuffer(gl, geometry->rest.positions);
    const unsigned normals = makeVertexBuffer(gl, geometry->rest.normals);
    vyra::DeformableMesh& mesh = evaluator.createMesh(geometry, {positions, normals});
    auto& taper = mesh.add<TaperDeformer>();
    for (std::uint16_t frame = 0; frame < 10; ++frame) {
        taper.taper = -0.05F * static_cast<float>(frame);
        evaluator.evaluate(em::Id(frame));
        evaluator.waitUntilDrawable();
        // ... draw ...
        evaluator.renderingComplete();
    }
    if (!evaluator.status().ok())
        return std::fprintf(stderr, "%s\n", evaluator.status().message.c_str()), 1;
    if (!mesh.usesOpenCL())
        return std::fprintf(stderr, "OpenCL is off; the lines above name the reason.\n"), 1;

    const vyra::Surface expected = mesh.deformOnCpu();
    const float largest = std::max(difference(gl, positions, expected.positions),
                                   difference(gl, normals, expected.normals));
    std::printf("tapered on OpenCL; the largest difference from the CPU is %g\n",
                static_cast<double>(largest));
    return largest < 1e-5F ? 0 : 1;
}
