#include "viewer/app/Controls.h"

#include <algorithm>
#include <iomanip>
#include <iterator>
#include <sstream>

#include <Qt>

namespace viewer {
namespace {

struct KeyBinding {
    int key; // Qt::Key
    const char* name;
    Action action;
    const char* label;       // for the overlay, where space is short
    const char* description; // for the help
};

constexpr KeyBinding kBindings[] = {
    {Qt::Key_Space, "Space", Action::kPause, "pause", "Pauses and resumes."},
    {Qt::Key_R, "R", Action::kDeformers, "rest",
     "Disables all deformers (rest shape), and enables them."},
    {Qt::Key_C, "C", Action::kSideBySide, "CPU",
     "Shows a copy that the CPU deforms, on the right."},
    {Qt::Key_D, "D", Action::kDetail, "detail", "Switches the level of detail."},
    {Qt::Key_O, "O", Action::kOverlay, "overlay", "Hides and shows the overlay."},
    {Qt::Key_Home, "Home", Action::kResetView, "view", "Restores the initial view."},
    {Qt::Key_Escape, "Esc", Action::kQuit, "quit", "Quits."},
};

} // namespace

std::optional<Action> actionOfKey(int key) noexcept
{
    const auto* found = std::find_if(std::begin(kBindings), std::end(kBindings),
                                     [key](const KeyBinding& each) { return each.key == key; });
    return found == std::end(kBindings) ? std::nullopt : std::optional(found->action);
}

std::optional<std::size_t> deformerOfKey(int key) noexcept
{
    if (key < Qt::Key_1 || key > Qt::Key_9)
        return std::nullopt;
    return static_cast<std::size_t>(key - Qt::Key_1);
}

std::string keyHelp()
{
    constexpr int kNameWidth = 8;
    std::ostringstream text;
    for (const KeyBinding& binding : kBindings)
        text << "  " << std::left << std::setw(kNameWidth) << binding.name << binding.description
             << '\n';
    text << "  " << std::left << std::setw(kNameWidth) << "1 to 9"
         << "Disables and enables one deformer of the chain.\n";
    return text.str();
}

std::string keySummary()
{
    std::string text;
    for (const KeyBinding& binding : kBindings)
        text += std::string(text.empty() ? "" : "  ") + binding.name + ' ' + binding.label;
    return text + "  1-9 one deformer";
}

} // namespace viewer
