// The rules of driver versions and synchronisation modes, row by row: pure functions.
#include "runtime/DriverVersion.h"
#include "runtime/SyncModes.h"

#include <exception>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace {

struct DriverRow {
    std::optional<int> ignore; // VYRA_OPENCL_IGNORE_DRIVER_VERSION, if it is set
    bool usable;
    bool implicitSync;
    bool asyncReadback;
    std::vector<const char*> versions;
};

const DriverRow kDriverRows[] = {
    // Only the first three characters and the two after the fourth are read.
    {{}, true, false, false, {"359.90", " 99.99"}},
    {{}, true, false, true, {"359.91", "360.00", "361.91", "361.910"}},
    {{}, false, false, true, {"361.92", "362.00", "365910", "368.85"}},
    {{}, true, false, true, {"368.86", "369.00", "385.3", "385.30", "385. 9"}},
    {{}, true, true, true, {"385.31", "385x31.9", "386.00", "999.99"}},
    {-1, false, false, true, {"365.10"}},
    {-1, true, true, true, {"400.99"}},
    {0, true, false, true, {"365.10"}},
    {0, true, true, true, {"385.31"}},
    {1, true, true, true, {"365.10"}},
    {2, true, true, false, {"300.00"}},
};

TEST(DriverVersionRule, MatchesTable)
{
    for (const DriverRow& row : kDriverRows) {
        for (const char* version : row.versions) {
            SCOPED_TRACE(testing::Message() << version << ' ' << row.ignore.value_or(-99));
            const DriverVerdict verdict = judgeDriver(parseDriverVersion(version), row.ignore);
            EXPECT_EQ(verdict.usable, row.usable);
            EXPECT_EQ(verdict.implicitSync, row.implicitSync);
            EXPECT_EQ(verdict.asyncReadback, row.asyncReadback);
        }
    }
}

TEST(DriverVersionRule, ParseThrowsForMalformedVersion)
{
    for (const char* text :
         {"", "385", "38", "abc.31", "385.", "385.xy", "   .31", "385.  ", "3610.92"}) {
        SCOPED_TRACE(text);
        EXPECT_THROW(parseDriverVersion(text), std::exception);
    }
}

// The host uses the same numbers.
static_assert(kNVIDIAProvider == 0 && kAMDProvider == 1 && kIntelProvider == 2);
static_assert(kAppleProvider == 3 && kUnknownProvider == 4);

enum Message { kSilent, kUnstable, kUsesGLFinish, kUsesEventInfo };
const char* const kMessages[] = {
    "",
    "VYRA_GRAPHICSTOOPENCL_SYNC_MODE=1 (Implicit Graphics to OpenCL synchronization) is not "
    "supported because cl_khr_gl_event is not supported.  Vyra will run in implicit sync mode but "
    "expect unstable results.\n",
    "Overriding VYRA_GRAPHICSTOOPENCL_SYNC_MODE=2 (Explicit Graphics to OpenCL synchronization) "
    "because GL_ARB_sync is not supported.  Using glFinish to synchronize.\n",
    "Overriding VYRA_OPENCLTOGRAPHICS_SYNC_MODE=1 (Implicit OpenCL to Graphics synchronization) "
    "because cl_khr_gl_event is not supported.  Using clGetEventInfo to synchronize.\n"};

struct SyncRow {
    int variable;
    SyncAbilities abilities; // glEvent, arbSync, implicitSyncTrusted
    int mode;
    Message message;
};

constexpr SyncAbilities kAll{true, true, true};
constexpr SyncAbilities kNone{false, false, true};

const SyncRow kGraphicsToCLRows[] = {
    {0, {true, false, false}, 1, kSilent},
    {0, kAll, 1, kSilent},
    {0, {false, true, true}, 2, kSilent},
    {0, kNone, 3, kSilent},
    {-1, {false, true, true}, 2, kSilent},
    {4, {false, true, true}, 2, kSilent},
    {1, kAll, 1, kSilent},
    {1, {false, true, true}, 1, kUnstable},
    {2, kAll, 2, kSilent},
    {2, {false, true, true}, 2, kSilent},
    {2, {true, false, true}, 3, kUsesGLFinish},
    {3, kAll, 3, kSilent},
    {3, kNone, 3, kSilent},
};
const SyncRow kCLToGraphicsRows[] = {
    {0, kAll, 1, kSilent},
    {0, {true, false, true}, 1, kSilent},
    {0, {true, true, false}, 2, kSilent},
    {0, {false, true, true}, 2, kSilent},
    {0, kNone, 2, kSilent},
    {-7, kAll, 1, kSilent},
    {5, {false, true, true}, 2, kSilent},
    {1, {true, false, false}, 1, kSilent},
    {1, {false, true, true}, 2, kUsesEventInfo},
    {2, kNone, 2, kSilent},
    {3, kNone, 3, kSilent},
    {4, kNone, 4, kSilent},
};

template <typename Choose>
void expectModes(const Choose& choose, const SyncRow& row)
{
    SCOPED_TRACE("variable " + std::to_string(row.variable) + ", event " +
                 std::to_string(row.abilities.glEvent) + ", sync " +
                 std::to_string(row.abilities.arbSync));
    const auto choice = choose(row.variable, row.abilities);
    EXPECT_EQ(choice.mode, row.mode);
    EXPECT_STREQ(choice.message ? choice.message : "", kMessages[row.message]);
}

TEST(SyncModeRule, MatchesTable)
{
    for (const SyncRow& row : kGraphicsToCLRows)
        expectModes(chooseGraphicsToCLSyncMode, row);
    for (const SyncRow& row : kCLToGraphicsRows)
        expectModes(chooseCLToGraphicsSyncMode, row);
}

} // namespace
