#include "evaluator/Deformer.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <optional>

namespace vyra {
namespace {

std::string quoted(std::string_view text)
{
    return "'" + std::string(text) + "'";
}

std::string numberText(float number)
{
    char text[32];
    const auto [end, error] = std::to_chars(std::begin(text), std::end(text), number);
    return {text, end};
}

template <typename Names, typename NameOf>
std::string list(const Names& names, const NameOf& nameOf)
{
    std::string text;
    for (const auto& name : names)
        text += (text.empty() ? "" : ", ") + std::string(nameOf(name));
    return text.empty() ? "none" : text;
}

// Returns the whole text as a finite number, or nothing.
std::optional<float> parseNumber(std::string_view text)
{
    float number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (error != std::errc() || end != text.data() + text.size() || !std::isfinite(number))
        return std::nullopt;
    return number;
}

std::string setNumber(const DeformerParameter& parameter, std::string_view text)
{
    const std::optional<float> number = parseNumber(text);
    unsigned* whole = nullptr;
    if (unsigned* const* pointer = std::get_if<unsigned*>(&parameter.value))
        whole = *pointer;
    const bool fits = number && *number >= parameter.least && *number <= parameter.greatest &&
                      (!whole || std::trunc(*number) == *number);
    if (!fits)
        return "the parameter " + quoted(parameter.name) + " takes a " +
               (whole ? "whole number" : "number") + " from " + numberText(parameter.least) +
               " to " + numberText(parameter.greatest) + ", not " + quoted(text);
    if (whole)
        *whole = static_cast<unsigned>(*number);
    else
        *std::get<float*>(parameter.value) = *number;
    return {};
}

std::string setChoice(const DeformerParameter& parameter, std::string_view text)
{
    const auto found = std::find(parameter.choices.begin(), parameter.choices.end(), text);
    if (found == parameter.choices.end())
        return "the parameter " + quoted(parameter.name) + " is one of " +
               list(parameter.choices, [](std::string_view name) { return name; }) + ", not " +
               quoted(text);
    *std::get<unsigned*>(parameter.value) =
        static_cast<unsigned>(found - parameter.choices.begin());
    return {};
}

} // namespace

Deformer::~Deformer() = default;

std::string Deformer::mismatch(const MeshGeometry& /*geometry*/) const
{
    return {};
}

unsigned Deformer::passCount() const
{
    return 1;
}

bool Deformer::readsNeighbours() const
{
    return false;
}

std::vector<DeformerParameter> Deformer::parameters()
{
    return {};
}

std::string setParameter(Deformer& deformer, std::string_view name, std::string_view value)
{
    const std::vector<DeformerParameter> parameters = deformer.parameters();
    for (const DeformerParameter& parameter : parameters) {
        if (parameter.name == name)
            return parameter.choices.empty() ? setNumber(parameter, value)
                                             : setChoice(parameter, value);
    }
    return "the deformer " + quoted(deformer.name()) + " has no parameter " + quoted(name) +
           "; it has " +
           list(parameters, [](const DeformerParameter& parameter) { return parameter.name; });
}

} // namespace vyra
