// Writes files completely or not at all.
#pragma once

#include <optional>
#include <string>

#include <QByteArray>

namespace viewer {

// Writes `content` to the file `path`, replacing an existing file. Returns nothing on success, else
// the system's reason; a partly written file is removed, a device is not.
[[nodiscard]] std::optional<std::string> writeFile(const std::string& path,
                                                   const QByteArray& content);

} // namespace viewer
