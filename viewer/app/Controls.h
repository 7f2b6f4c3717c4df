// What the keys of the playing window do.
#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace viewer {

enum class Action { kPause, kDeformers, kSideBySide, kOverlay, kDetail, kResetView, kQuit };

// The place in the chain of the deformer that the key (of Qt::Key) switches: 0 for the key 1.
// Nothing for other keys.
std::optional<std::size_t> deformerOf(int key);

// Nothing when the key (of Qt::Key) does nothing.
std::optional<Action> actionOf(int key);

// A line for each key.
std::string keyHelp();
// The same in one short line.
std::string keyReminder();

} // namespace viewer
