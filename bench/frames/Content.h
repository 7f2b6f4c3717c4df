// The deformers of the characters of a crowd.
#pragma once

#include "frames/CpuDeformation.h"
#include "viewer/model/Model.h"

#include <memory>
#include <string>
#include <vector>

struct Content {
    using MakeDeformation = std::unique_ptr<CpuDeformation> (*)(const viewer::Scene&);

    const char* name;                // in options and tables
    const char* deformers;           // in the viewer's syntax
    std::vector<int> crowds;         // default numbers of characters
    void (*prepare)(viewer::Model&); // adds the data that the deformers require
    MakeDeformation deformOnCpu;
    MakeDeformation deformOnCpuPlainly; // null if there is no such path
    double normalBound;                 // maximum deviation of a normal from the reference
};

// The first is typical of characters, with little work per byte. The others have much work per
// byte.
const std::vector<Content>& contents();
// Throws std::runtime_error, with the list of names, if there is no such content.
const Content& contentOf(const std::string& name);
