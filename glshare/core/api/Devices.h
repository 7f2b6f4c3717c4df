// How the runtime's devices look to the application.
#pragma once

#include "core/api/OpenCl.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace glshare {

// Whether a device shares with OpenGL by its own means; this program then leaves it alone.
[[nodiscard]] bool sharesByItself(cl_device_id device);

// Whether the runtime itself can be asked for shared objects in a context that is not ours: one
// that offers no sharing may do anything when it is asked for it, ending the process included.
[[nodiscard]] bool runtimeShares(cl_context context);

// Whether the runtime of a context has the functions of OpenCL 3.0.
[[nodiscard]] bool offersVersion3(cl_context context);

// The device's own type, not what the application is told.
[[nodiscard]] cl_device_type ownType(cl_device_id device);

// What the application is told.
[[nodiscard]] cl_device_type shownType(cl_device_type own);

// The question to ask of the runtime when the application asks for `wanted`; empty if no device can
// match.
[[nodiscard]] std::optional<cl_device_type> typeToAskFor(cl_device_type wanted);

// The platform's devices that the application sees as `wanted`; empty on any failure.
[[nodiscard]] std::vector<cl_device_id> devicesOf(cl_platform_id platform, cl_device_type wanted);

// `platform`, or the runtime's first platform if it is null; null if there is none.
[[nodiscard]] cl_platform_id platformOrFirst(cl_platform_id platform);

// The extensions added here, in the order of the extension strings.
[[nodiscard]] const std::vector<std::string_view>& addedExtensions();

// For the shell, before the first question: one more, with what it offers itself. The text is kept.
void addExtension(std::string_view name);

// Whether `extensions`, a list separated by spaces, contains `name` as a word.
[[nodiscard]] bool containsExtension(std::string_view extensions, std::string_view name);

// `own` and the added extensions, unless it offers sharing already.
[[nodiscard]] std::string shownExtensions(std::string own);

} // namespace glshare
