// Files that are written whole or not at all.
#pragma once

#include <optional>
#include <string>

#include <QByteArray>

namespace viewer {

// Writes a file of this content, replacing an earlier one. Returns the system's reason if that
// fails, and leaves no part of the file. A device of that name stays.
std::optional<std::string> writeFile(const std::string& path, const QByteArray& content);

} // namespace viewer
