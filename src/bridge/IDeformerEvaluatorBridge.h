// Where the modules of the host find the deformer evaluator.
#pragma once

#include "VyraOpenCLExport.h"
#include "bridge/IDeformerEvaluatorBridgeAPI.h"

// The one place in the process where an evaluator is published. The object is borrowed: its
// publisher keeps it alive while it is published and withdraws it with setAPI(nullptr). Nothing is
// locked; callers order publishing and reading.
class VYRA_OPENCL_API IDeformerEvaluatorBridge {
public:
    IDeformerEvaluatorBridge() = default;
    IDeformerEvaluatorBridge(const IDeformerEvaluatorBridge& other) = default;
    IDeformerEvaluatorBridge& operator=(const IDeformerEvaluatorBridge& other);
    IDeformerEvaluatorBridge& operator=(IDeformerEvaluatorBridge&& other) noexcept;

    // The published object, or null.
    static IDeformerEvaluatorBridgeAPI* getAPI();
    // Publishes `api`, or withdraws with null. The object published before is not told.
    static void setAPI(IDeformerEvaluatorBridgeAPI* api);

private:
    static IDeformerEvaluatorBridgeAPI* sfAPI;
};
