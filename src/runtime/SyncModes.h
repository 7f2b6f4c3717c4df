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
    bool implicitSyncTrusted = false; // not an NVIDIA driver that is known to release too early
};

// The mode for a variable's value and the abilities. Where a forced mode is overridden or
// unsupported, that is said on standard error.
TopenCLInfo::GraphicsToCLSyncMode chooseGraphicsToCLSyncMode(int variable,
                                                             const SyncAbilities& abilities);
TopenCLInfo::CLToGraphicsSyncMode chooseCLToGraphicsSyncMode(int variable,
                                                             const SyncAbilities& abilities);
