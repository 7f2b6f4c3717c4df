// Devices, platforms and extensions, as the runtime reports them and as the application sees them.
#pragma once

#include "core/api/OpenCl.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace glshare {

// Returns whether the runtime itself offers cl_khr_gl_sharing for a device. glshare then passes all
// calls on.
[[nodiscard]] bool sharesNatively(cl_device_id device);

// Returns whether the runtime itself offers sharing in a context that glshare has not created. A
// runtime without sharing must not be asked for shared objects: it may end the process.
[[nodiscard]] bool runtimeSharesNatively(cl_context context);

// Returns whether the runtime of a context has the functions of OpenCL 3.0.
[[nodiscard]] bool supportsOpenCl3(cl_context context);

// Returns the type of a device as the runtime reports it.
[[nodiscard]] cl_device_type runtimeType(cl_device_id device);

// Returns the type that the application sees for a device of type `type`.
[[nodiscard]] cl_device_type reportedType(cl_device_type type);

// Returns the type to pass to the runtime when the application requests `requested`; empty if no
// device can match.
[[nodiscard]] std::optional<cl_device_type> runtimeTypeFor(cl_device_type requested);

// Returns the platform's devices that the application sees as `requested`; empty on failure.
[[nodiscard]] std::vector<cl_device_id> devicesOf(cl_platform_id platform,
                                                  cl_device_type requested);

// Returns `platform`, or the runtime's first platform if it is null; null if there is none.
[[nodiscard]] cl_platform_id platformOrFirst(cl_platform_id platform);

// Returns the extensions that glshare adds, in the order of the extension strings.
[[nodiscard]] const std::vector<std::string_view>& addedExtensions();

// Adds one more extension. `name` must outlive the process's last query. Called before the
// application's first OpenCL call.
void addExtension(std::string_view name);

// Returns whether `extensions`, a list separated by spaces, contains `name`.
[[nodiscard]] bool containsExtension(std::string_view extensions, std::string_view name) noexcept;

// Returns the runtime's extension string with the added extensions. A string that lists
// cl_khr_gl_sharing already is returned unchanged.
[[nodiscard]] std::string reportedExtensions(std::string extensions);

} // namespace glshare
