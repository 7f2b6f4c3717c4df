// Imports a model in a child process, which protects the viewer from crashes and endless imports.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"
#include "viewer/model/import/ModelImport.h"

#include <functional>
#include <string>

namespace viewer {

// How to start and watch the child process.
struct ImportChild {
    std::string program; // the viewer's own executable
    int timeLimit = 60;  // seconds
    // Called several times a second with the whole seconds since the start. Returning false cancels
    // the import.
    std::function<bool(int seconds)> progress;
};

// Does the same as importModel in a child process. A crash, a time-out and lack of memory are
// failures, too. Blocks until the child has ended.
[[nodiscard]] Result<Model> importInChild(const ImportChild& child, const std::string& name,
                                          const ImportSettings& settings);

// Returns whether the arguments of main are those with which importInChild starts the program.
[[nodiscard]] bool isImportChild(int argc, char* argv[]) noexcept;

// Runs the child: writes the serialised model to standard output. Returns the exit code.
[[nodiscard]] int runImportChild(char* argv[]);

} // namespace viewer
