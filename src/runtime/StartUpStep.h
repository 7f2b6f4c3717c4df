// The step that start-up has reached. Internal, for tools that explain why start-up stopped.
#pragma once

// The steps at which start-up can stop, in order.
enum class StartUpStep {
    kNotStarted,
    kSwitch,
    kLoader,
    kVendor,
    kPlatform,
    kD3D11Sharing,
    kDevice,
    kDriver,
    kContext,
    kSharingFunctions,
    kAvailability,
    kDoublePrecision,
    kQueue, // covers the steps after it, which leave the object valid
};

// Returns the last step that start-up began. Unless TopenCLInfo::isValid(), this is the step that
// stopped it. Not synchronised with a start-up on another thread.
StartUpStep startUpStep() noexcept;

// Records that start-up begins `step`.
void enterStartUpStep(StartUpStep step) noexcept;
