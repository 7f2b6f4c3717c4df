// What the keys of the playing window do.
#pragma once

#include <optional>
#include <string>

namespace viewer {

enum class Action { kPause, kDeformers, kSideBySide, kOverlay, kDetail, kQuit };

// Nothing when the key (of Qt::Key) does nothing.
std::optional<Action> actionOf(int key);

// A line for each key.
std::string keyHelp();
// The same in one short line.
std::string keyReminder();

} // namespace viewer
