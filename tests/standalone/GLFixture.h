// A test with an application and a current OpenGL context, of each kind that a host may have.
#pragma once

#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLWindow>

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <string>
#include <string_view>

struct GLKind {
    // QT_XCB_GL_INTEGRATION: which window-system interface Qt uses on X.
    const char* integration;
    bool windowed;

    bool isEGL() const { return std::string_view(integration) == "xcb_egl"; }
    friend void PrintTo(const GLKind& kind, std::ostream* output) { *output << kind.integration; }
};

std::string nameOf(const testing::TestParamInfo<GLKind>& info);

// Every kind, to instantiate a test with.
inline constexpr GLKind allGLKinds[] = {
    {"xcb_glx", true}, {"xcb_glx", false}, {"xcb_egl", true}, {"xcb_egl", false}};

class GLTest : public testing::TestWithParam<GLKind> {
protected:
    // Skips the test on a machine without display or OpenGL.
    void SetUp() override;
    void TearDown() override;

    // The context that is current after SetUp; the window's when there is one.
    QOpenGLContext& context() const;
    // Null in the kinds without a window.
    QOpenGLWindow* window() const { return fWindow.get(); }
    void makeCurrent() const;

private:
    void openWindow();
    void createOffscreen();

    std::unique_ptr<QGuiApplication> fApplication;
    std::unique_ptr<QOpenGLWindow> fWindow;
    std::unique_ptr<QOffscreenSurface> fSurface;
    std::unique_ptr<QOpenGLContext> fContext;
};
