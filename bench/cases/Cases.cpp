#include "cases/Cases.h"

#include <iterator>
#include <utility>

namespace {

void append(std::vector<GroupMaker>& all, std::vector<GroupMaker> groups)
{
    std::move(groups.begin(), groups.end(), std::back_inserter(all));
}

} // namespace

std::vector<GroupMaker> allGroups(Runtime* runtime)
{
    std::vector<GroupMaker> all = kernelGroups();
    append(all, poolGroups());
    append(all, transferGroups());
    append(all, eventGroups());
    append(all, dataMapGroups());
    append(all, batchGroups(runtime));
    append(all, sharingGroups(runtime));
    append(all, evaluatorGroups(runtime));
    return all;
}
