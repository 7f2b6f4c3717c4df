#include "tools/info/report/TextReport.h"

#include "tools/info/report/Extensions.h"
#include "tools/info/report/ReportWriter.h"
#include "tools/info/rules/Verdicts.h"
#include "tools/info/text/StatusCodes.h"
#include "tools/info/text/TextFormatting.h"

#include <array>
#include <cstdio>

namespace info {
namespace {

constexpr char kSelfTestRemedy[] =
    "Run this again with VYRA_OPENCL_FORCE_FINISH=1. If the numbers are right then, the driver "
    "does "
    "not order OpenCL and OpenGL as it promises: let the host run with that variable, and update "
    "the driver. If they stay wrong, the driver's sharing or its compiler fails.";

std::string milliseconds(double value)
{
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "%.3f ms", value);
    return text.data();
}

void addStop(Sheet& sheet, const Stop& stop)
{
    sheet.section("Why it is off");
    sheet.paragraph(stop.reason);
    sheet.section("What helps");
    sheet.paragraph(stop.remedy);
    sheet.section("Steps of start-up");
    for (const StepName& name : stepNames()) {
        const char* result = name.step < stop.step ? "passed" : "not reached";
        sheet.row(name.title, name.step == stop.step ? "STOPPED HERE" : result);
    }
}

void addRenderer(Sheet& sheet, const Renderer& renderer)
{
    sheet.section("OpenGL, which draws");
    if (!renderer.usable) {
        sheet.row("Usable", "no: " + renderer.problem);
        return;
    }
    sheet.row("Renderer", renderer.renderer);
    sheet.row("Vendor", renderer.vendor);
    sheet.row("Version", renderer.version);
    sheet.row("Window system", renderer.windowSystem);
    sheet.row("Vendor id of the GPU", renderer.adapterVendorId ? hex(*renderer.adapterVendorId)
                                                               : "none follows from these texts");
    sheet.row("GL_ARB_sync", yesOrNo(renderer.syncObjects));
}

void addLoader(Sheet& sheet, const Loader& loader)
{
    sheet.section("OpenCL library");
    sheet.row("Loaded", loader.loaded ? loader.file : "no");
    if (!loader.problem.empty())
        sheet.row("Problem", loader.problem);
    if (!loader.missingCore.empty())
        sheet.row("Missing, needed always", commaList(loader.missingCore));
    if (loader.loaded && !loader.missingSharing.empty())
        sheet.row("Missing, needed for sharing", commaList(loader.missingSharing));
}

std::string verdict(const std::string& rejection)
{
    return rejection.empty() ? "accepted" : "not accepted: " + rejection;
}

void addDevice(Sheet& sheet, const Facts& facts, const Platform& platform, const Device& device)
{
    sheet.section("  Device: " + device.name);
    sheet.row("Verdict", verdict(deviceRejection(facts, platform, device)));
    sheet.row("Type", deviceTypeName(device.type));
    sheet.row("Vendor", device.vendor + (device.vendorId ? ", id " + hex(*device.vendorId) : ""));
    sheet.row("Version, driver", device.version + ", " + device.driverVersion);
    sheet.row("Compute units", std::to_string(device.computeUnits));
    sheet.row("Shares with the OpenGL context", yesOrNo(device.sharesWithRenderer));
    sheet.row("Drives the OpenGL context", yesOrNo(device.drivesRenderer));
    sheet.row("Available", yesOrNo(device.available));
    sheet.row("Double precision", yesOrNo(device.doublePrecision));
    for (const Extension& extension : relevantExtensions())
        sheet.row(extension.name, yesOrNo(listsExtension(device.extensions, extension.name)));
}

void addPlatforms(Sheet& sheet, const Facts& facts)
{
    if (facts.loader.loaded && facts.platforms.empty()) {
        sheet.section("Platforms");
        sheet.paragraph("There is none: " + describeStatus(facts.platformStatus) + ".");
    }
    for (const Platform& platform : facts.platforms) {
        sheet.section("Platform: " + platform.name);
        sheet.row("Verdict", verdict(platformRejection(facts, platform)));
        sheet.row("Vendor", platform.vendor);
        sheet.row("Version", platform.version);
        for (const Extension& extension : relevantExtensions())
            sheet.row(extension.name, yesOrNo(listsExtension(platform.extensions, extension.name)) +
                                          " (" + extension.purpose + ")");
        for (const Device& device : platform.devices)
            addDevice(sheet, facts, platform, device);
    }
}

void addDecisions(Sheet& sheet, const Explanation& explanation)
{
    if (explanation.decisions.empty())
        return;
    sheet.section("What was decided, and why");
    for (const Decision& decision : explanation.decisions)
        sheet.row(decision.title, decision.value + ", because " + decision.reason + ".");
    const std::string pair = rendererBesideDevice(explanation.facts);
    if (!pair.empty())
        sheet.row("Note", pair + ".");
}

const char* effectText(Effect effect)
{
    switch (effect) {
    case Effect::kChanged:
        return "had an effect: ";
    case Effect::kNone:
        return "no effect: ";
    case Effect::kUnknown:
        return "UNKNOWN: ";
    case Effect::kNoted:
        return "noted: ";
    }
    return "";
}

void addVariables(Sheet& sheet, const Explanation& explanation)
{
    sheet.section("Environment variables that are set");
    if (explanation.variables.empty())
        sheet.paragraph("None that matters.");
    for (const VariableReport& report : explanation.variables) {
        std::string text = effectText(report.effect) + report.explanation + ".";
        if (!report.suggestion.empty())
            text += " Probably " + report.suggestion + " is meant.";
        sheet.paragraph(report.name + "=" + report.value);
        sheet.row("", text);
    }
}

void addSelfTest(Sheet& sheet, const SelfTest& test)
{
    sheet.section("Self-test: a shared buffer of " + std::to_string(test.vertices) + " vertices");
    sheet.row("Result", test.passed
                            ? "right in " + std::to_string(test.evaluations) + " evaluations"
                            : "FAILED: " + test.problem);
    if (test.status != CL_SUCCESS)
        sheet.row("Status", describeStatus(test.status));
    if (!test.passed) {
        sheet.row("What helps", kSelfTestRemedy);
        return;
    }
    sheet.row("Building the kernel", milliseconds(test.times.kernelBuild));
    sheet.row("First evaluation", milliseconds(test.times.firstEvaluation));
    sheet.row("Evaluation, median", milliseconds(test.times.evaluation));
    sheet.row("Acquire, waited for", milliseconds(test.times.acquire));
    sheet.row("Kernel, waited for", milliseconds(test.times.kernel));
    sheet.row("Release, waited for", milliseconds(test.times.release));
    sheet.row("OpenGL reads the result", milliseconds(test.times.read));
}

void addWarnings(Sheet& sheet, const std::string& title, const std::vector<std::string>& warnings)
{
    if (warnings.empty())
        return;
    sheet.section(title);
    for (const std::string& warning : warnings) {
        const std::optional<int> status = statusInWarning(warning);
        if (status)
            sheet.row("OpenCL error", describeStatus(*status));
        else
            sheet.quote(warning);
    }
}

} // namespace

std::string textReport(const Explanation& explanation)
{
    const Facts& facts = explanation.facts;
    Sheet sheet;
    sheet.section(explanation.summary);
    if (explanation.stop)
        addStop(sheet, *explanation.stop);
    addRenderer(sheet, facts.renderer);
    addLoader(sheet, facts.loader);
    addPlatforms(sheet, facts);
    addDecisions(sheet, explanation);
    addVariables(sheet, explanation);
    if (facts.selfTest)
        addSelfTest(sheet, *facts.selfTest);
    addWarnings(sheet, "Failing OpenCL calls during start-up", facts.startUp.warnings);
    if (facts.selfTest)
        addWarnings(sheet, "Failing OpenCL calls during the self-test", facts.selfTest->warnings);
    if (facts.startUp.attempted) {
        sheet.section("What start-up printed");
        sheet.quote(facts.startUp.output);
    }
    return sheet.text();
}

} // namespace info
