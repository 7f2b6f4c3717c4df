#include "bridge/IDeformerEvaluatorBridge.h"

constinit IDeformerEvaluatorBridgeAPI* IDeformerEvaluatorBridge::sfAPI = nullptr;

IDeformerEvaluatorBridge&
IDeformerEvaluatorBridge::operator=(const IDeformerEvaluatorBridge&) = default;
IDeformerEvaluatorBridge&
IDeformerEvaluatorBridge::operator=(IDeformerEvaluatorBridge&&) noexcept = default;

IDeformerEvaluatorBridgeAPI* IDeformerEvaluatorBridge::getAPI()
{
    return sfAPI;
}

void IDeformerEvaluatorBridge::setAPI(IDeformerEvaluatorBridgeAPI* api)
{
    sfAPI = api;
}
