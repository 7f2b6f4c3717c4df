// Names of the environment variables that the library reads. docs/messages.md describes their
// values. Internal.
#pragma once

inline constexpr char kDisableOpenCLVariable[] = "VYRA_DISABLE_OPENCL";
inline constexpr char kPlatformVariable[] = "VYRA_OPENCL_PLATFORM";
inline constexpr char kMinimumVerticesVariable[] = "VYRA_OPENCL_DEFORMER_MIN_VERTS";
inline constexpr char kIgnoreDriverVersionVariable[] = "VYRA_OPENCL_IGNORE_DRIVER_VERSION";
inline constexpr char kOffWithoutDoubleVariable[] = "VYRA_OPENCL_OFF_WITHOUT_DOUBLE_SUPPORT";
inline constexpr char kForceFinishVariable[] = "VYRA_OPENCL_FORCE_FINISH";
inline constexpr char kGraphicsToCLSyncVariable[] = "VYRA_GRAPHICSTOOPENCL_SYNC_MODE";
inline constexpr char kCLToGraphicsSyncVariable[] = "VYRA_OPENCLTOGRAPHICS_SYNC_MODE";
inline constexpr char kForceThreadingVariable[] = "VYRA_OPENCL_FORCE_THREADING";
