// The import of a model in a process of its own, which may crash or never end.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/Model.h"
#include "viewer/model/import/ModelImport.h"

#include <functional>
#include <string>

namespace viewer {

struct ImportChild {
    std::string program; // the viewer's own executable
    int timeLimit = 60;  // seconds
    // Called several times a second with the whole seconds since the start. False ends the import.
    std::function<bool(int seconds)> progress;
};

// Same as importModel, but a crash, an import that takes longer than the time limit, and one that
// needs more memory than there is are failures as well.
Result<Model> importInChild(const ImportChild& child, const std::string& name,
                            const ImportSettings& settings);

// Whether these are the arguments of main with which importInChild starts the program.
bool isImportChild(int argc, char* argv[]);

// The main function of the child.
int runImportChild(char* argv[]);

} // namespace viewer
