// The rules that choose how OpenCL and OpenGL wait for each other. Internal.
#pragma once

#include "runtime/TopenCLInfo.h"

// The variables that force a mode; 0 where one is not set or not an integer, which means
// "automatic".
struct SyncModeVariables {
    int forceFinish = 0;  // VYRA_OPENCL_FORCE_FINISH
    int graphicsToCL = 0; // VYRA_GRAPHICSTOOPENCL_SYNC_MODE
    int clToGraphics = 0; // VYRA_OPENCLTOGRAPHICS_SYNC_MODE
};

SyncModeVariables readSyncModeVariables();

// What the platform, the renderer and the driver can do.
struct SyncAbilities {
    bool glEvent = false;             // the platform lists cl_khr_gl_event
    bool arbSync = false;             // the renderer has GL_ARB_sync
    bool implicitSyncTrusted = false; // no NVIDIA driver that is too old for it
};

// A mode, and what the user is told when a forced mode is overridden or unsupported; null when
// nothing is.
template <typename Mode>
struct SyncModeChoice {
    Mode mode;
    const char* message = nullptr;
};

// The mode for a variable's value and the abilities.
SyncModeChoice<TopenCLInfo::GraphicsToCLSyncMode>
chooseGraphicsToCLSyncMode(int variable, const SyncAbilities& abilities);
SyncModeChoice<TopenCLInfo::CLToGraphicsSyncMode>
chooseCLToGraphicsSyncMode(int variable, const SyncAbilities& abilities);
