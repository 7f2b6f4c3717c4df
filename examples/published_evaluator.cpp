// Publishes an evaluator through the bridge, and finds it there as another module of the host
// would.
#include "bridge/IDeformerEvaluatorBridge.h"
#include "host/EvaluationId.h"

#include <cstdio>

namespace {

class CountingEvaluator : public IDeformerEvaluatorBridgeAPI {
public:
    void evaluate(const em::Id& id) override
    {
        std::printf("evaluation %d\n", id.value());
        ++fEvaluations;
    }
    int evaluations() const { return fEvaluations; }

private:
    int fEvaluations = 0;
};

// Stands for another module, which includes the bridge but not the evaluator's class.
bool evaluateFrame(std::uint16_t frame)
{
    IDeformerEvaluatorBridgeAPI* evaluator = IDeformerEvaluatorBridge::getAPI();
    if (!evaluator)
        return false;
    evaluator->evaluate(em::Id(frame));
    return true;
}

} // namespace

int main()
{
    CountingEvaluator evaluator;
    IDeformerEvaluatorBridge::setAPI(&evaluator);
    const bool evaluated = evaluateFrame(1) && evaluateFrame(2);

    // Withdrawn before its destruction: the bridge only borrows it.
    IDeformerEvaluatorBridge::setAPI(nullptr);
    return evaluated && evaluator.evaluations() == 2 && !evaluateFrame(3) ? 0 : 1;
}
