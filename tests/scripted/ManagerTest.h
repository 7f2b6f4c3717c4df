// The fixture of tests on a shared-buffer manager.
#pragma once

#include "Objects.h"
#include "ScriptedTest.h"
#include "host/EvaluationId.h"

#include <memory>

namespace scripted {

inline const em::Id kId(1); // of an evaluation

// A manager that the test owns; TearDown destroys it, and none of its objects may remain.
class ManagerTest : public ScriptedTest {
protected:
    // Starts in these modes and creates the manager; startWithBuffer also creates and returns a
    // buffer.
    void startIn(int graphicsToCL, int clToGraphics)
    {
        startInModes(graphicsToCL, clToGraphics);
        makeManager();
        calls();
    }
    void makeManager() { fManager = std::make_unique<TopenCLSharedBufferMgr>(); }
    const TopenCLSharedBuffer* startWithBuffer(int graphicsToCL, int clToGraphics)
    {
        startIn(graphicsToCL, clToGraphics);
        return create();
    }
    void dropManager() { fManager.reset(); }
    void TearDown() override
    {
        dropManager();
        ScriptedTest::TearDown();
    }
    const TopenCLSharedBuffer* create(int expectedStatus = CL_SUCCESS)
    {
        int status = 1;
        const auto* buffer = makeShared(manager(), &status);
        EXPECT_EQ(status, expectedStatus);
        return buffer;
    }
    void evaluate()
    {
        manager().PreEvaluate(kId);
        manager().PostEvaluate(kId);
    }
    int acquire(const TopenCLSharedBuffer* buffer, cl_event* event = nullptr)
    {
        return manager().EnqueueAcquireSharedCLBuffer(queue(), buffer, event);
    }
    int release(const TopenCLSharedBuffer* buffer, cl_event* event = nullptr)
    {
        const cl_mem mem = buffer->fMem.get();
        return manager().EnqueueReleaseSharedCLBuffer(queue(), 1, &mem, 0, nullptr, event);
    }
    TopenCLSharedBufferMgr& manager() { return *fManager; }

private:
    std::unique_ptr<TopenCLSharedBufferMgr> fManager;
};

} // namespace scripted
