// Command line, reasons why OpenCL cannot be used, report and overlay.
#include "viewer/app/Options.h"
#include "viewer/app/Report.h"
#include "viewer/opencl/StartFailure.h"
#include "viewer/overlay/OverlayText.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace viewer;
using testing::AllOf, testing::HasSubstr, testing::Not;

Result<Options> parse(const QString& line)
{
    return parseOptions(QStringList{"vyra-viewer"} + line.split(' ', Qt::SkipEmptyParts));
}

// The runs of the program cover the other options.
TEST(Options, ParseReturnsEachGivenValue)
{
    const Result<Options> result =
        parse("--frames 60 --crowd 64 --size 640x360 --output out --every 5 --min-verts 0 "
              "--resize-every 7 --up z --crease 30 --load-limit 5 a.fbx");
    ASSERT_TRUE(result) << result.failure().text;
    const Options& options = result.value();
    EXPECT_EQ(options.crowd, 64);
    EXPECT_EQ(options.size, QSize(640, 360));
    EXPECT_EQ(options.every, 5);
    EXPECT_EQ(options.minimumVertices, 0);
    EXPECT_EQ(options.resizeEvery, 7);
    EXPECT_EQ(options.import.up, UpAxis::kZ);
    EXPECT_EQ(options.import.creaseAngle, 30);
    EXPECT_EQ(options.loadLimit, 5);
}

TEST(Options, ParseAcceptsModelOrHelpOrVersionAlone)
{
    const Result<Options> result = parse("a.fbx");
    ASSERT_TRUE(result) << result.failure().text;
    EXPECT_FALSE(result.value().frames || result.value().minimumVertices);
    EXPECT_EQ(result.value().crowd, 1);
    EXPECT_FALSE(result.value().verify || result.value().allowCpu || result.value().help);
    EXPECT_TRUE(parse("--help").value().help);
}

TEST(Options, ParseFailsWithAReasonForEachWrongValue)
{
    const std::pair<const char*, std::vector<const char*>> rows[] = {
        {"more than one model", {"a b"}},
        {"frames", {"--frames"}},
        {"not 'many'", {"--frames many a"}},
        {"--frames takes a whole number", {"--frames 0 a", "--frames -3 a", "--frames 1.5 a"}},
        {"--crowd takes a whole number",
         {"--crowd 0 a", "--crowd 10001 a", "--crowd 99999999999 a"}},
        {"--min-verts takes a whole number", {"--min-verts -1 a"}},
        {"--resize-every takes a whole number", {"--resize-every 0 a"}},
        {"--size takes WIDTHxHEIGHT",
         {"--size 640 a", "--size 640x a", "--size 15x480 a", "--size 99999x480 a"}},
        {"--up takes x, y or z", {"--up w a", "--up= a"}},
        {"--crease takes a whole number", {"--crease 181 a"}},
        {"--load-limit takes a whole number", {"--load-limit 0 a"}},
        {"takes a value that is not empty",
         {"--animation= a", "--output= --frames 1 a", "--trace= a", "--platform= a"}},
        {"--output needs --frames", {"--output out a"}},
    };
    for (const auto& [reason, lines] : rows) {
        for (const char* line : lines) {
            const Result<Options> result = parse(line);
            ASSERT_FALSE(result) << line;
            EXPECT_EQ(result.failure().code, ExitCode::kUsage) << line;
            EXPECT_THAT(result.failure().text, AllOf(HasSubstr(reason), HasSubstr("--help")));
        }
    }
}

TEST(OpenCLPlatforms, AdapterVendorIdReturnsTheVendorOfTheRendererStrings)
{
    const std::tuple<const char*, const char*, std::optional<unsigned>> rows[] = {
        {"NVIDIA Corporation", "NVIDIA H100/PCIe/SSE2", 0x10DE},
        {"ATI Technologies Inc.", "FirePro V7900", 0x1002},
        {"X.Org", "AMD Radeon RX 580 (polaris10)", 0x1002},
        {"Intel", "Mesa Intel(R) UHD Graphics 630 (CFL GT2)", 0x8086},
        {"Mesa", "llvmpipe (AMD Ryzen 7 3700X)", std::nullopt},
        {"Microsoft Corporation", "GDI Generic", std::nullopt},
    };
    for (const auto& [vendor, renderer, id] : rows)
        EXPECT_EQ(adapterVendorId(vendor, renderer), id) << vendor << ' ' << renderer;
}

TEST(StartFailure, ReturnsFirstReasonAndAdviceNotTakenYet)
{
    const OpenCLPlatform alone{"A", "a", false, 1};
    const OpenCLPlatform sharing{"B", "b", true, 1};
    const OpenCLPlatform empty{"The pocl project", "p", true, 0};
    const auto with = [](auto change) {
        StartDiagnostics diagnostics;
        diagnostics.platforms = {{"A", "a", true, 1}, {"B", "b", true, 1}};
        change(diagnostics);
        return startFailure(diagnostics).text;
    };
    const std::pair<std::string, const char*> rows[] = {
        {with([](StartDiagnostics& d) {
             d.missingLayers = {"/none.so"};
             d.disabled = true;
         }),
         "OPENCL_LAYERS names '/none.so', which is not a file; correct the variable, or use "
         "--allow-cpu"},
        {with([](StartDiagnostics& d) {
             d.disabled = true;
             d.cpuIsAllowed = true;
         }),
         "OpenCL is switched off, since VYRA_DISABLE_OPENCL is set; unset the variable"},
        {with([&](StartDiagnostics& d) {
             d.vendor = empty.vendor;
             d.platforms = {alone, empty};
         }),
         "'The pocl project' has 0 devices; PoCL has none if it cannot write its cache"},
        {with([&](StartDiagnostics& d) { d.platforms = {empty}; }), "has 0 devices"},
        {with([&](StartDiagnostics& d) {
             d.vendor = "A";
             d.platforms = {alone, sharing};
         }),
         "the OpenCL platform of 'A' does not offer cl_khr_gl_sharing"},
        {with([](StartDiagnostics&) {}), "choose one with --platform: 'A', 'B'"},
        {with([](StartDiagnostics& d) {
             d.vendor = "A";
             d.platformIsGiven = true;
             d.warnings = {"OpenCL error: CL_OUT_OF_HOST_MEMORY"};
         }),
         "with this renderer (OpenCL error: CL_OUT_OF_HOST_MEMORY); use --allow-cpu"},
        {with([](StartDiagnostics& d) { d.vendorId = 0x10DE; }),
         "for the reason above; name another platform with --platform, or use --allow-cpu"},
    };
    for (const auto& [text, expected] : rows)
        EXPECT_THAT(text, HasSubstr(expected));
}

TEST(Report, PercentileReturnsTheNearestMeasuredValue)
{
    const std::tuple<std::vector<double>, double, double> rows[] = {
        {{}, 0.5, 0},
        {{7}, 0.95, 7},
        {{4, 1, 3, 2}, 0.5, 2},
        {{5, 1, 3, 2, 4}, 0.5, 3},
        {{5, 1, 3, 2, 4}, 0.95, 5},
        {{2, 1}, 0, 1},
        {{2, 1}, 1, 2},
    };
    for (const auto& [values, part, expected] : rows)
        EXPECT_EQ(percentile(values, part), expected);
}

TEST(Report, DeviationLineContainsVerdictAndWarnsIfNothingRanOnOpenCL)
{
    const char* itself = "compared with itself";
    RunStatistics run;
    run.deviation = Deviation{2 * kPositionBound};
    EXPECT_THAT(reportText(run), AllOf(HasSubstr("FAILED"), HasSubstr(itself)));
    run.deviation = Deviation{kPositionBound, kNormalBound, kNormalBound};
    run.distribution = {true, 3, 2, 500};
    EXPECT_THAT(reportText(run), AllOf(HasSubstr("passed"), Not(HasSubstr(itself))));
}

TEST(MeshDistribution, DeformedByReturnsWhyTheCpuDeforms)
{
    const std::pair<MeshDistribution, const char*> rows[] = {
        {{false, 3, 3, 0}, "the CPU, since OpenCL is not used"},
        {{true, 3, 3, 500}, "the CPU, since all meshes have fewer than 500 vertices"},
        {{true, 3, 1, 500}, "OpenCL, but 1 meshes by the CPU: they have fewer than 500 vertices"},
        {{true, 3, 0, 500}, "OpenCL, all of them"},
    };
    for (const auto& [distribution, text] : rows)
        EXPECT_EQ(deformedBy(distribution), text);
}

TEST(OverlayText, ContainsOnlyLinesWithAValue)
{
    OverlayContent content{{{"a device", "2, fence", "4, finish", 128}},
                           {true, 1, 0, 0},
                           59.9,
                           1.5,
                           {},
                           true,
                           "skin",
                           "Esc quit"};
    EXPECT_THAT(overlayText(content),
                AllOf(HasSubstr("59.90\n"), HasSubstr("1.50 ms"), HasSubstr("a device\n"),
                      HasSubstr("2, fence\n"), HasSubstr("4, finish\n"), HasSubstr("128 vertex"),
                      HasSubstr("paused\n"), HasSubstr("skin\n"), HasSubstr("Esc quit\n"),
                      Not(HasSubstr("on the right"))));
    content = {{}, {}, 0, 1.5, 7.25, false, "skin", {}};
    EXPECT_THAT(overlayText(content), AllOf(HasSubstr("7.25 ms"), Not(HasSubstr("Batch")),
                                            Not(HasSubstr("paused")), Not(HasSubstr("second"))));
}

TEST(OverlayText, FirstLinesTruncatesLongTextAndCountsOmittedLines)
{
    EXPECT_EQ(firstLines("one\ntwo"), "one\ntwo\n");
    const std::string cut = firstLines(std::string(1000, 'x') + std::string(99, '\n'));
    EXPECT_LT(cut.size(), 200u);
    EXPECT_THAT(cut, HasSubstr("\n... and 83 more lines\n"));
}

} // namespace
