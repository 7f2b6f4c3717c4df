// What the characters of a crowd go through in each frame.
#pragma once

#include "frames/CpuDeformation.h"
#include "viewer/model/Model.h"

#include <memory>
#include <string>
#include <vector>

struct Content {
    using MakeDeformation = std::unique_ptr<CpuDeformation> (*)(const viewer::Scene&);

    const char* name;                // in options and tables
    const char* deformers;           // as the viewer reads them
    std::vector<int> crowds;         // numbers of characters that are measured by default
    void (*prepare)(viewer::Model&); // adds to the model what the deformers need
    MakeDeformation deformOnCpu;
    MakeDeformation deformOnCpuPlainly; // null: there is no such path
    double normalBound;                 // how far a normal may deviate from the reference
};

// The first one is what most characters are made of, and little work for each byte. The others are
// much work for each byte.
const std::vector<Content>& contents();
// Throws std::runtime_error, which lists the names, if there is no such content.
const Content& contentOf(const std::string& name);
