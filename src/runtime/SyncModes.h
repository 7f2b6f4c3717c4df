// The choice of the modes in which OpenCL and OpenGL wait for each other. Internal.
#pragma once

#include "runtime/TopenCLInfo.h"

// The values of the variables that force a mode. 0, for a variable that is not set or not an
// integer, means automatic.
struct SyncModeVariables {
    int forceFinish = 0;  // VYRA_OPENCL_FORCE_FINISH
    int graphicsToCL = 0; // VYRA_GRAPHICSTOOPENCL_SYNC_MODE
    int clToGraphics = 0; // VYRA_OPENCLTOGRAPHICS_SYNC_MODE
};

SyncModeVariables readSyncModeVariables();

// The abilities of platform, renderer and driver.
struct SyncAbilities {
    bool glEvent = false;             // the platform lists cl_khr_gl_event
    bool arbSync = false;             // the renderer has GL_ARB_sync
    bool implicitSyncTrusted = false; // false for NVIDIA drivers that are too old for it
};

// A mode, and the message for standard error if a forced mode is overridden or unsupported; else
// null.
template <typename Mode>
struct SyncModeChoice {
    Mode mode;
    const char* message = nullptr;
};

// Return the mode for a variable's value and the abilities.
SyncModeChoice<TopenCLInfo::GraphicsToCLSyncMode>
chooseGraphicsToCLSyncMode(int variable, const SyncAbilities& abilities);
SyncModeChoice<TopenCLInfo::CLToGraphicsSyncMode>
chooseCLToGraphicsSyncMode(int variable, const SyncAbilities& abilities);
