#include "bridge/IDeformerEvaluatorBridgeAPI.h"

IDeformerEvaluatorBridgeAPI::IDeformerEvaluatorBridgeAPI() = default;
IDeformerEvaluatorBridgeAPI::IDeformerEvaluatorBridgeAPI(const IDeformerEvaluatorBridgeAPI&) =
    default;
IDeformerEvaluatorBridgeAPI&
IDeformerEvaluatorBridgeAPI::operator=(const IDeformerEvaluatorBridgeAPI&) = default;
IDeformerEvaluatorBridgeAPI::~IDeformerEvaluatorBridgeAPI() = default;
