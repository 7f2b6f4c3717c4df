// A test with an application and a current OpenGL context, of each kind that a host may have.
#pragma once

#include <QGuiApplication>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLWindow>

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <tuple>

// The value of QT_XCB_GL_INTEGRATION, which selects Qt's interface on X, and whether there is a
// window.
using GLKind = std::tuple<std::string, bool>;

// All kinds, to instantiate a test with, and their names.
inline const auto kAllGLKinds = testing::Combine(
    testing::Values(std::string("xcb_glx"), std::string("xcb_egl")), testing::Bool());
std::string nameOf(const testing::TestParamInfo<GLKind>& info);

class GLTest : public testing::TestWithParam<GLKind> {
protected:
    ~GLTest() override;

    // Skips the test on a machine without display or OpenGL.
    void SetUp() override;

    // The context that is current after SetUp; the window's when there is one.
    QOpenGLContext& context() const;
    // Null in the kinds without a window.
    QOpenGLWindow* window() const { return fWindow.get(); }
    void makeCurrent() const;

private:
    // Destroyed in reverse order: the context before its surface, the application last.
    std::unique_ptr<QGuiApplication> fApplication;
    std::unique_ptr<QOpenGLWindow> fWindow;
    std::unique_ptr<QOffscreenSurface> fSurface;
    std::unique_ptr<QOpenGLContext> fContext;
};
