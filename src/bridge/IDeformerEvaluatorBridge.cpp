#include "bridge/IDeformerEvaluatorBridge.h"

IDeformerEvaluatorBridgeAPI::IDeformerEvaluatorBridgeAPI() = default;
IDeformerEvaluatorBridgeAPI::IDeformerEvaluatorBridgeAPI(const IDeformerEvaluatorBridgeAPI&) =
    default;
IDeformerEvaluatorBridgeAPI&
IDeformerEvaluatorBridgeAPI::operator=(const IDeformerEvaluatorBridgeAPI&) = default;
IDeformerEvaluatorBridgeAPI::~IDeformerEvaluatorBridgeAPI() = default;

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
