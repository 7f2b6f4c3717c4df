// Keys of the window.
#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace viewer {

enum class Action { kPause, kDeformers, kSideBySide, kOverlay, kDetail, kResetView, kQuit };

// Returns the index in the chain of the deformer that a key (Qt::Key) toggles: 0 for the key 1.
// Empty for keys other than 1 to 9.
[[nodiscard]] std::optional<std::size_t> deformerOfKey(int key) noexcept;

// Returns the action of a key (Qt::Key), empty if it has none.
[[nodiscard]] std::optional<Action> actionOfKey(int key) noexcept;

// Returns help with one line for each key.
[[nodiscard]] std::string keyHelp();
// Returns a summary of the keys in one short line.
[[nodiscard]] std::string keySummary();

} // namespace viewer
