// Settings of an import that a user can choose.
#pragma once

#include <optional>

namespace viewer {

enum class UpAxis { kX, kY, kZ };

struct ImportSettings {
    // The axis of the file's coordinates that points up. Unset: the axis that the file names, or y
    // if it names none.
    std::optional<UpAxis> up;
    // Degrees, 0 to 180. In a mesh without normals in the file, an edge stays sharp if its
    // triangles meet at a larger angle.
    double creaseAngle = 60;
};

} // namespace viewer
