// Gives the modules of the host access to the deformer evaluator.
#pragma once

#include "VyraOpenCLExport.h"
#include "bridge/IDeformerEvaluatorBridgeAPI.h"

// Publishes one evaluator per process. The object is borrowed: its publisher keeps it alive while
// it is published and withdraws it with setAPI(nullptr). Takes no lock: callers order publishing
// and reading.
class VYRA_OPENCL_API IDeformerEvaluatorBridge {
public:
    IDeformerEvaluatorBridge() = default;
    IDeformerEvaluatorBridge(const IDeformerEvaluatorBridge& other) = default;
    IDeformerEvaluatorBridge& operator=(const IDeformerEvaluatorBridge& other);
    IDeformerEvaluatorBridge& operator=(IDeformerEvaluatorBridge&& other) noexcept;

    // Returns the published object, or null.
    static IDeformerEvaluatorBridgeAPI* getAPI();
    // Publishes `api` in place of the published object; null withdraws it. Calls neither object.
    static void setAPI(IDeformerEvaluatorBridgeAPI* api);

private:
    static IDeformerEvaluatorBridgeAPI* sfAPI;
};
