#include "host/Trace.h"

#include "standalone/TraceChannels.h"

#include <gmock/gmock.h>

#include <memory>
#include <sstream>

namespace {

using testing::ElementsAre;
using testing::Field;
using testing::StrEq;

TEST(TraceChannels, ListsTheChannelsThatExist)
{
    std::ostringstream output;
    auto first = std::make_unique<TdbTrace>(1, "first", output, "of two");
    const TdbTrace second(2, "second", TdebugOutput::sCerr(), "");

    const std::vector<TraceChannel> both = traceChannels();
    ASSERT_EQ(both.size(), 2u);
    EXPECT_EQ(both[0].level, 1);
    EXPECT_EQ(both[0].name, "first");
    EXPECT_EQ(both[0].description, "of two");
    EXPECT_EQ(both[0].output, &output);
    EXPECT_EQ(both[1].output, &TdebugOutput::sCerr());

    first.reset();
    EXPECT_THAT(traceChannels(), ElementsAre(Field(&TraceChannel::name, StrEq("second"))));
}

} // namespace
