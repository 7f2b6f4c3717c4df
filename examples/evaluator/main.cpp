// A window that shows a sheet with a travelling wave, computed by OpenCL in the vertex buffers that
// OpenGL draws from.
//
//   evaluator [FRAMES]     closes after so many frames; without a number it plays until it is
//   closed
#include "evaluator/Evaluator.h"
#include "evaluator/WaveDeformer.h"
#include "host/EvaluationId.h"
#include "runtime/TopenCLInfo.h"
#include "standalone/GLHost.h"
#include "standalone/NativeContext.h"
#include "standalone/OpenCLPlatforms.h"

#include <QGuiApplication>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <QOpenGLShaderProgram>
#include <QOpenGLWindow>
#include <cstdio>
#include <cstdlib>

constexpr const char* kVertexShader = R"(#version 330 core
layout(location = 0) in vec3 position;
layout(location = 1) in vec3 normal;
out vec3 shade;
void main()
{
    gl_Position = vec4(position.x, 0.5 * position.z + position.y, 0.5 * position.z, 1.0);
    shade = vec3(0.3, 0.5, 0.8) * (0.4 + 0.6 * max(dot(normal, normalize(vec3(0.5, 1, 0.5))), 0));
})";
constexpr const char* kFragmentShader = R"(#version 330 core
in vec3 shade;
out vec4 colour;
void main() { colour = vec4(shade, 1); })";

// A flat square sheet from -0.8 to 0.8 with `side` vertices along each edge.
vyra::MeshGeometry makeSheet(unsigned side)
{
    vyra::MeshGeometry sheet;
    sheet.name = "sheet";
    for (unsigned i = 0; i < side * side; ++i) {
        const auto along = [side](unsigned step) {
            return 1.6F * static_cast<float>(step) / static_cast<float>(side - 1) - 0.8F;
        };
        sheet.rest.positions.push_back({along(i % side), 0, along(i / side)});
        sheet.rest.normals.push_back({0, 1, 0});
        if (i % side + 1 < side && i / side + 1 < side)
            for (const unsigned corner : {0U, side, 1U, 1U, side, side + 1})
                sheet.triangles.push_back(i + corner);
    }
    return sheet;
}

class Window : public QOpenGLWindow {
public:
    explicit Window(int frames) : fFramesLeft(frames) {}
    ~Window() override
    {
        makeCurrent(); // the evaluator and the host use the context
        fEvaluator.reset();
        fHost.reset();
    }
    bool failed() const { return fFailed; }

private:
    void initializeGL() override
    {
        QOpenGLExtraFunctions& gl = *context()->extraFunctions();
        fShaders.addShaderFromSourceCode(QOpenGLShader::Vertex, kVertexShader);
        fShaders.addShaderFromSourceCode(QOpenGLShader::Fragment, kFragmentShader);
        fShaders.link();
        auto sheet = std::make_shared<const vyra::MeshGeometry>(makeSheet(128));
        fIndexCount = static_cast<GLsizei>(sheet->triangles.size());
        gl.glGenVertexArrays(1, &fVertexArray);
        gl.glBindVertexArray(fVertexArray);
        vyra::VertexBuffers buffers;
        buffers.positions = makeAttribute(gl, 0, sheet->rest.positions);
        buffers.normals = makeAttribute(gl, 1, sheet->rest.normals);
        unsigned indices = 0;
        gl.glGenBuffers(1, &indices);
        gl.glBindBuffer(GL_ELEMENT_ARRAY_BUFFER, indices);
        gl.glBufferData(GL_ELEMENT_ARRAY_BUFFER, fIndexCount * GLsizeiptr{sizeof(unsigned)},
                        sheet->triangles.data(), GL_STATIC_DRAW);

        // The library starts once, with the renderer; then the evaluator gets the mesh.
        fHost = std::make_unique<GLHost>(*this);
        TopenCLInfo::initialize(nullptr, nativeContext(*context()), nullptr, false, true,
                                chooseOpenCLPlatform(*context()));
        vyra::EvaluatorSettings settings;
        settings.finishRenderer = [&gl] { gl.glFinish(); };
        settings.flushRenderer = [&gl] { gl.glFlush(); };
        fEvaluator = std::make_unique<vyra::Evaluator>(std::move(settings));
        vyra::DeformableMesh& mesh = fEvaluator->createMesh(std::move(sheet), buffers);
        fWave = &mesh.add<vyra::WaveDeformer>();
        if (!mesh.usesOpenCL())
            stop("OpenCL is off; the lines above name the reason");
    }

    void paintGL() override
    {
        fWave->phase += 0.1F;
        fEvaluator->evaluate(em::Id(fFrame++ % 0x8000));
        fEvaluator->waitUntilDrawable();

        QOpenGLExtraFunctions& gl = *context()->extraFunctions();
        gl.glClearColor(0.95F, 0.95F, 0.93F, 1);
        gl.glClear(GL_COLOR_BUFFER_BIT | GL_DEPTH_BUFFER_BIT);
        gl.glEnable(GL_DEPTH_TEST);
        fShaders.bind();
        gl.glBindVertexArray(fVertexArray);
        gl.glDrawElements(GL_TRIANGLES, fIndexCount, GL_UNSIGNED_INT, nullptr);
        fEvaluator->renderingComplete();

        if (!fEvaluator->status().ok())
            stop(fEvaluator->status().message.c_str());
        if (fFramesLeft > 0 && --fFramesLeft == 0)
            QGuiApplication::exit();
        update();
    }

    unsigned makeAttribute(QOpenGLExtraFunctions& gl, unsigned location,
                           const std::vector<vyra::Vector3>& contents)
    {
        unsigned buffer = 0;
        gl.glGenBuffers(1, &buffer);
        gl.glBindBuffer(GL_ARRAY_BUFFER, buffer);
        gl.glBufferData(GL_ARRAY_BUFFER,
                        static_cast<GLsizeiptr>(contents.size() * sizeof(vyra::Vector3)),
                        contents.data(), GL_DYNAMIC_DRAW);
        gl.glVertexAttribPointer(location, 3, GL_FLOAT, GL_FALSE, 0, nullptr);
        gl.glEnableVertexAttribArray(location);
        return buffer;
    }

    void stop(const char* reason)
    {
        std::fprintf(stderr, "%s\n", reason);
        fFailed = true;
        QGuiApplication::exit();
    }

    int fFramesLeft; // 0: no limit
    bool fFailed = false;
    std::uint16_t fFrame = 0;
    std::unique_ptr<GLHost> fHost;
    std::unique_ptr<vyra::Evaluator> fEvaluator;
    vyra::WaveDeformer* fWave = nullptr; // the mesh's
    QOpenGLShaderProgram fShaders;
    unsigned fVertexArray = 0;
    GLsizei fIndexCount = 0;
};

int main(int argc, char** argv)
{
    QSurfaceFormat format;
    format.setVersion(3, 3);
    format.setProfile(QSurfaceFormat::CoreProfile);
    format.setDepthBufferSize(24);
    QSurfaceFormat::setDefaultFormat(format);
    QGuiApplication application(argc, argv);
    Window window(argc > 1 ? std::atoi(argv[1]) : 0);
    window.resize(640, 480);
    window.show();
    QGuiApplication::exec();
    return window.failed() ? 1 : 0;
}
