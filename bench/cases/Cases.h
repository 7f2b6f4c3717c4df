// All groups of cases, room by room.
#pragma once

#include "harness/Group.h"

class Runtime;

std::vector<GroupMaker> kernelGroups();
std::vector<GroupMaker> poolGroups();
std::vector<GroupMaker> transferGroups();
std::vector<GroupMaker> eventGroups();
std::vector<GroupMaker> dataMapGroups();
// These share buffers with the renderer; `runtime` is used when a group is made.
std::vector<GroupMaker> batchGroups(Runtime* runtime);
std::vector<GroupMaker> sharingGroups(Runtime* runtime);
std::vector<GroupMaker> evaluatorGroups(Runtime* runtime);

std::vector<GroupMaker> allGroups(Runtime* runtime);
