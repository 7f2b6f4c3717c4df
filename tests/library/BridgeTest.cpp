#include "bridge/IDeformerEvaluatorBridge.h"
#include "host/EvaluationId.h"

#include <memory>
#include <type_traits>

#include <gtest/gtest.h>

// Neither has data members.
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
    auto owned = std::make_unique<Evaluator>(destroyed);
    const Evaluator& evaluator = *owned;
    IDeformerEvaluatorBridge::setAPI(owned.get());
    IDeformerEvaluatorBridge::getAPI()->evaluate(em::Id(7));
    EXPECT_EQ(evaluator.lastEvaluation, 7);

    // Modules of the host call through the virtual table: the destructor has two slots, then
    // evaluate.
    using Evaluate = void(IDeformerEvaluatorBridgeAPI*, const em::Id&);
    Evaluate** slots = *reinterpret_cast<Evaluate***>(IDeformerEvaluatorBridge::getAPI());
    slots[2](owned.get(), em::Id(8));
    EXPECT_EQ(evaluator.lastEvaluation, 8);

    IDeformerEvaluatorBridge::setAPI(nullptr);
    EXPECT_EQ(IDeformerEvaluatorBridge::getAPI(), nullptr);
    EXPECT_FALSE(destroyed) << "the bridge deleted a borrowed evaluator";
    std::unique_ptr<IDeformerEvaluatorBridgeAPI> base = std::move(owned);
    base.reset();
    EXPECT_TRUE(destroyed) << "deleting through the interface must destroy the evaluator";
}
