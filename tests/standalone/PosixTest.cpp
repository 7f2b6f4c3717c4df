// Not for Windows, where setting a variable to the empty text removes it, a wchar_t has 16 bits,
// and each library may have streams of its own.
#include "host/Environment.h"
#include "host/Trace.h"
#include "host/Tstring.h"

#include "Platform.h"

#include <gtest/gtest.h>

#include <iostream>

TEST(Environment, TellsAnEmptyVariableFromAMissingOne)
{
    constexpr const char* variable = "VYRA_HOST_TEST_VARIABLE";
    EXPECT_EQ(VyraGetEnv(variable), nullptr);
    setEnvironment(variable, "");
    EXPECT_STREQ(VyraGetEnv(variable), "");
}

TEST(String, FindsCharactersOfFourBytes)
{
    EXPECT_EQ(Tstring("a\xc3\xa9\xf0\x9f\x98\x80").findMB(wchar_t{0x1f600}), 3);
}

TEST(TraceChannels, WriteToStandardError)
{
    EXPECT_EQ(&TdebugOutput::sCerr(), &std::cerr);
}
