// The interface of the deformer evaluator.
#pragma once

#include "VyraOpenCLExport.h"

namespace em {
class Id;
}

// Implemented by the evaluator and published through IDeformerEvaluatorBridge. The publisher owns
// the object.
class VYRA_OPENCL_API IDeformerEvaluatorBridgeAPI {
public:
    IDeformerEvaluatorBridgeAPI();
    IDeformerEvaluatorBridgeAPI(const IDeformerEvaluatorBridgeAPI& other);
    IDeformerEvaluatorBridgeAPI& operator=(const IDeformerEvaluatorBridgeAPI& other);
    virtual ~IDeformerEvaluatorBridgeAPI();

    // Runs the deformers of evaluation `id`.
    virtual void evaluate(const em::Id& id) = 0;
};
