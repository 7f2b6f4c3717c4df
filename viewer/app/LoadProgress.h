// What the user sees while a model is loaded.
#pragma once

#include <string>

class QWindow;

namespace viewer {

// Shows the seconds in the window's title and on standard error, from one second on.
class LoadProgress {
public:
    // Borrows the window.
    LoadProgress(QWindow& window, std::string model);
    // Restores the title.
    ~LoadProgress();
    LoadProgress(const LoadProgress&) = delete;
    LoadProgress& operator=(const LoadProgress&) = delete;

    // Handles the window's events. Returns false once the user closed the window or pressed Ctrl-C.
    bool show(int seconds);

private:
    QWindow& fWindow;
    std::string fModel;
    int fShown = 0; // seconds
};

} // namespace viewer
