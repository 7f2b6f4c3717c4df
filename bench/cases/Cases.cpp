#include "cases/Cases.h"

#include <iterator>
#include <utility>

namespace {

void append(std::vector<GroupFactory>& all, std::vector<GroupFactory> groups)
{
    std::move(groups.begin(), groups.end(), std::back_inserter(all));
}

} // namespace

std::vector<GroupFactory> allGroups(Runtime* runtime)
{
    std::vector<GroupFactory> all = kernelGroups();
    append(all, poolGroups());
    append(all, transferGroups());
    append(all, eventGroups());
    append(all, dataMapGroups());
    append(all, batchGroups(runtime));
    append(all, sharingGroups(runtime));
    append(all, evaluatorGroups(runtime));
    return all;
}
