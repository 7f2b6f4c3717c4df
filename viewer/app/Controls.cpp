#include "viewer/app/Controls.h"

#include <algorithm>
#include <iomanip>
#include <iterator>
#include <sstream>

#include <Qt>

namespace viewer {
namespace {

struct KeyBinding {
    int key; // of Qt::Key
    const char* name;
    Action action;
    const char* word;    // for the overlay, which has little room
    const char* meaning; // for the help
};

constexpr KeyBinding kBindings[] = {
    {Qt::Key_Space, "Space", Action::kPause, "pause", "Time stands still, and goes on."},
    {Qt::Key_R, "R", Action::kDeformers, "rest", "Deformers off (the shape at rest), and on."},
    {Qt::Key_C, "C", Action::kSideBySide, "CPU", "A copy that the CPU deforms, on the right."},
    {Qt::Key_D, "D", Action::kDetail, "detail", "The other level of detail."},
    {Qt::Key_O, "O", Action::kOverlay, "overlay", "The overlay off, and on."},
    {Qt::Key_Home, "Home", Action::kResetView, "view", "The first view again."},
    {Qt::Key_Escape, "Esc", Action::kQuit, "quit", "Quits."},
};

} // namespace

std::optional<Action> actionOf(int key)
{
    const auto* found = std::find_if(std::begin(kBindings), std::end(kBindings),
                                     [key](const KeyBinding& each) { return each.key == key; });
    return found == std::end(kBindings) ? std::nullopt : std::optional(found->action);
}

std::optional<std::size_t> deformerOf(int key)
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
        text << "  " << std::left << std::setw(kNameWidth) << binding.name << binding.meaning
             << '\n';
    text << "  " << std::left << std::setw(kNameWidth) << "1 to 9"
         << "One deformer of the chain off, and on.\n";
    return text.str();
}

std::string keyReminder()
{
    std::string text;
    for (const KeyBinding& binding : kBindings)
        text += std::string(text.empty() ? "" : "  ") + binding.name + ' ' + binding.word;
    return text + "  1-9 one deformer";
}

} // namespace viewer
