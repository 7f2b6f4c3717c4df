#include "host/Trace.h"

#include "standalone/TraceChannels.h"

#include <gmock/gmock.h>

#include <memory>
#include <sstream>

namespace {

using testing::ElementsAre;
using testing::FieldsAre;
using testing::StrEq;

TEST(TraceChannels, TraceChannelsListsExistingChannels)
{
    std::ostringstream output;
    auto first = std::make_unique<TdbTrace>(1, "first", output, "of two");
    const TdbTrace second(2, "second", TdebugOutput::sCerr(), "");
    const auto isSecond = FieldsAre(2, StrEq("second"), StrEq(""), &TdebugOutput::sCerr());
    EXPECT_THAT(traceChannels(),
                ElementsAre(FieldsAre(1, StrEq("first"), StrEq("of two"), &output), isSecond));
    first.reset();
    EXPECT_THAT(traceChannels(), ElementsAre(isSecond));
}

} // namespace
