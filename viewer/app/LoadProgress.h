// Shows the progress of loading a model.
#pragma once

#include <string>

class QWindow;

namespace viewer {

// Shows the elapsed seconds in the window's title and on standard error.
class LoadProgress {
public:
    // Borrows the window.
    LoadProgress(QWindow& window, std::string model);
    // Restores the title.
    ~LoadProgress();
    LoadProgress(const LoadProgress&) = delete;
    LoadProgress& operator=(const LoadProgress&) = delete;

    // Updates the title if `seconds` has increased, and processes the window's events. Returns
    // false if the user has closed the window or pressed Ctrl-C.
    [[nodiscard]] bool show(int seconds);

private:
    QWindow& fWindow;
    std::string fModel;
    int fShown = 0; // seconds
};

} // namespace viewer
