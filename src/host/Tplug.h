// The host's handle of an attribute of a graph node.
#pragma once

#include "host/HostExport.h"

#include <cstdint>

// A value: a node of the dependency graph and one of its attributes.
class VYRA_HOST_API Tplug {
public:
    constexpr Tplug() = default;
    constexpr Tplug(std::uint64_t node, std::uint64_t attribute)
        : fNode(node), fAttribute(attribute)
    {
    }

    // The plug of no node. Constant-initialised, so that static objects of other modules may copy
    // it.
    static const Tplug fsNULL;

    // Returns a 64-bit hash of node and attribute.
    std::uint64_t hash() const;

    bool operator==(const Tplug& other) const = default;

private:
    std::uint64_t fNode = 0;
    std::uint64_t fAttribute = 0;
};
