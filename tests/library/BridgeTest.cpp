#include "bridge/IDeformerEvaluatorBridge.h"
#include "host/EvaluationId.h"

#include <memory>
#include <type_traits>
#include <utility>

#include <gtest/gtest.h>

// Neither has data of its own.
static_assert(sizeof(IDeformerEvaluatorBridgeAPI) == sizeof(void*));
static_assert(std::is_empty_v<IDeformerEvaluatorBridge>);

namespace {

class Evaluator : public IDeformerEvaluatorBridgeAPI {
public:
    explicit Evaluator(bool& destroyed) : fDestroyed(destroyed) {}
    ~Evaluator() override { fDestroyed = true; }
    void evaluate(const em::Id& id) override { lastEvaluation = id.value(); }

    int lastEvaluation = -1;

private:
    bool& fDestroyed;
};

} // namespace

TEST(Bridge, PublishesOneBorrowedEvaluator)
{
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), nullptr);

    bool destroyed = false;
    auto first = std::make_unique<Evaluator>(destroyed);
    bool otherDestroyed = false;
    Evaluator second(otherDestroyed);
    IDeformerEvaluatorBridge::setAPI(first.get());
    IDeformerEvaluatorBridge::getAPI()->evaluate(em::Id(7));
    EXPECT_EQ(first->lastEvaluation, 7);

    // Modules of the host call by slot: those of the destructor (two in this ABI), then evaluate.
    using Evaluate = void(IDeformerEvaluatorBridgeAPI*, const em::Id&);
    Evaluate** slots = *reinterpret_cast<Evaluate***>(IDeformerEvaluatorBridge::getAPI());
    slots[2](first.get(), em::Id(8));
    EXPECT_EQ(first->lastEvaluation, 8);

    IDeformerEvaluatorBridge::setAPI(&second);
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), &second);
    EXPECT_FALSE(destroyed) << "the bridge deleted what it only borrowed";

    IDeformerEvaluatorBridge bridge;
    IDeformerEvaluatorBridge other;
    EXPECT_EQ(&(other = bridge), &other);
    EXPECT_EQ(&(bridge = std::move(other)), &bridge);
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), &second) << "a bridge has nothing of its own";

    Evaluator copy(second);
    IDeformerEvaluatorBridgeAPI& interface = copy;
    EXPECT_EQ(&(interface = second), &interface);

    IDeformerEvaluatorBridge::setAPI(nullptr);
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), nullptr);
    std::unique_ptr<IDeformerEvaluatorBridgeAPI> base = std::move(first);
    base.reset();
    EXPECT_TRUE(destroyed) << "deleting through the interface must destroy the evaluator";
}
