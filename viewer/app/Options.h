// Command-line options.
#pragma once

#include "viewer/Failure.h"
#include "viewer/model/DeformerChain.h"
#include "viewer/model/import/ModelImport.h"

#include <optional>
#include <string>
#include <vector>

#include <QSize>
#include <QStringList>

namespace viewer {

struct Options {
    std::string model;
    ImportSettings import;
    int loadLimit = 60;                    // seconds for loading a model
    std::string importProgram;             // for the import process; empty: no child process
    std::vector<DeformerChoice> deformers; // the chain, in order
    std::string animation;                 // empty: the first of the model
    std::optional<int> frames;             // number to render; unset: play in a window
    int crowd = 1;                         // number of characters
    QSize size{1280, 720};                 // pixels
    std::string output;                    // folder of the pictures; empty: none
    int every = 1;                         // period of the pictures, frames
    bool verify = false;                   // compare with the CPU reference
    std::string trace;                     // file of the trace; empty: none
    std::optional<int> minimumVertices;    // the CPU deforms meshes with fewer
    std::string platform;                  // vendor of the OpenCL platform; empty: by the renderer
    bool allowCpu = false;                 // continue without OpenCL
    int resizeEvery = 0;                   // period of level changes, frames; 0: none
    bool help = false;
    bool version = false;
};

// Parses the command line. `arguments` begins with the program's name. With --help or --version,
// values of other options are not checked.
[[nodiscard]] Result<Options> parseOptions(const QStringList& arguments);

// Returns the text of --help. Needs a QCoreApplication.
[[nodiscard]] std::string helpText();

} // namespace viewer
