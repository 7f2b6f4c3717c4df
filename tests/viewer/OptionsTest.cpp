// What the command line may hold, and what each mistake is answered with.
#include "viewer/Options.h"

#include <gtest/gtest.h>

namespace {

using namespace viewer;

Result<Options> parse(const QString& line)
{
    return parseOptions(QStringList{"vyra-viewer"} + line.split(' ', Qt::SkipEmptyParts));
}

TEST(Options, AreReadAsTheyAreGiven)
{
    const Result<Options> result = parse(
        "--frames 60 --crowd 64 --size 640x360 --output out --every 5 --verify --trace t.json "
        "--animation run --min-verts 0 --platform PoCL --allow-cpu --resize-every 7 a.fbx");
    ASSERT_TRUE(result) << result.failure().text;
    const Options& options = result.value();
    EXPECT_EQ(options.model, "a.fbx");
    EXPECT_EQ(options.frames, 60);
    EXPECT_EQ(options.crowd, 64);
    EXPECT_EQ(options.size, QSize(640, 360));
    EXPECT_EQ(options.output, "out");
    EXPECT_EQ(options.every, 5);
    EXPECT_TRUE(options.verify);
    EXPECT_EQ(options.trace, "t.json");
    EXPECT_EQ(options.animation, "run");
    EXPECT_EQ(options.minimumVertices, 0);
    EXPECT_EQ(options.platform, "PoCL");
    EXPECT_TRUE(options.allowCpu);
    EXPECT_EQ(options.resizeEvery, 7);
}

TEST(Options, AModelAloneIsEnough)
{
    const Result<Options> result = parse("a.fbx");
    ASSERT_TRUE(result) << result.failure().text;
    EXPECT_FALSE(result.value().frames);
    EXPECT_FALSE(result.value().minimumVertices);
    EXPECT_EQ(result.value().crowd, 1);
    EXPECT_FALSE(result.value().verify || result.value().allowCpu || result.value().help);
}

TEST(Options, EachMistakeIsNamed)
{
    const struct {
        const char* line;
        const char* says;
    } rows[] = {
        {"", "model is missing"},
        {"a.fbx b.fbx", "more than one model"},
        {"--bogus a.fbx", "bogus"},
        {"--frames", "frames"},
        {"--frames 0 a.fbx", "--frames takes a whole number"},
        {"--frames -3 a.fbx", "--frames takes a whole number"},
        {"--frames many a.fbx", "many"},
        {"--frames 1.5 a.fbx", "--frames takes a whole number"},
        {"--crowd 0 a.fbx", "--crowd takes a whole number"},
        {"--crowd 99999999999 a.fbx", "--crowd takes a whole number"},
        {"--min-verts -1 a.fbx", "--min-verts takes a whole number"},
        {"--resize-every 0 a.fbx", "--resize-every takes a whole number"},
        {"--size 640 a.fbx", "--size takes WIDTHxHEIGHT"},
        {"--size 640x a.fbx", "--size takes WIDTHxHEIGHT"},
        {"--size 0x480 a.fbx", "--size takes WIDTHxHEIGHT"},
        {"--size 99999x480 a.fbx", "--size takes WIDTHxHEIGHT"},
        {"--output out a.fbx", "--output needs --frames"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.line);
        const Result<Options> result = parse(row.line);
        ASSERT_FALSE(result);
        EXPECT_EQ(result.failure().code, ExitCode::kUsage);
        EXPECT_NE(result.failure().text.find(row.says), std::string::npos) << result.failure().text;
        EXPECT_NE(result.failure().text.find("--help"), std::string::npos);
    }
}

TEST(Options, HelpAsksForNothingElse)
{
    const Result<Options> result = parse("--help");
    ASSERT_TRUE(result) << result.failure().text;
    EXPECT_TRUE(result.value().help);
}

} // namespace
