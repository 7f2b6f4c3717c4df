// All groups of cases, by module.
#pragma once

#include "harness/Group.h"

class Runtime;

std::vector<GroupFactory> kernelGroups();
std::vector<GroupFactory> poolGroups();
std::vector<GroupFactory> transferGroups();
std::vector<GroupFactory> eventGroups();
std::vector<GroupFactory> dataMapGroups();
// These share buffers with the renderer. Creating a group uses `runtime`, which may be null until
// then.
std::vector<GroupFactory> batchGroups(Runtime* runtime);
std::vector<GroupFactory> sharingGroups(Runtime* runtime);
std::vector<GroupFactory> evaluatorGroups(Runtime* runtime);

std::vector<GroupFactory> allGroups(Runtime* runtime);
