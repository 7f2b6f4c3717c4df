// What the user asked for on the command line.
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
    int loadLimit = 60;                    // seconds that a model may take to load
    std::string importProgram;             // imports models; empty: this process does
    std::vector<DeformerChoice> deformers; // the chain, in order
    std::string animation;                 // empty: the model's first
    std::optional<int> frames;             // render so many and end; unset: play in a window
    int crowd = 1;                         // number of characters
    QSize size{1280, 720};                 // pixels
    std::string output;                    // folder of the pictures; empty: none
    int every = 1;                         // each so many frames a picture
    bool verify = false;                   // compare with the CPU reference
    std::string trace;                     // file of the trace; empty: none
    std::optional<int> minimumVertices;    // below it a mesh is deformed on the CPU
    std::string platform;                  // vendor of the OpenCL platform; empty: by the renderer
    bool allowCpu = false;                 // go on without OpenCL
    int resizeEvery = 0;                   // each so many frames another level of detail; 0: never
    bool help = false;
    bool version = false;
};

// `arguments` begins with the program's name. With --help or --version nothing else is checked.
Result<Options> parseOptions(const QStringList& arguments);

// The text of --help. Needs an application object.
std::string helpText();

} // namespace viewer
