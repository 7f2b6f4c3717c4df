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
    "Run this again with VYRA_OPENCL_FORCE_FINISH=1. If the numbers are right then, the driver does "
    "not order OpenCL and OpenGL as it promises: run the host with that variable, and update the "
    "driver. If they stay wrong, the driver's sharing or its compiler fails.";

std::string milliseconds(double value)
{
    std::array<char, 32> text{};
    std::snprintf(text.data(), text.size(), "%.3f ms", value);
    return text.data();
}

void addFailure(ReportWriter& writer, const StartUpFailure& failure)
{
    writer.section("Why it is off");
    writer.paragraph(failure.reason);
    writer.section("What helps");
    writer.paragraph(failure.remedy);
    writer.section("Steps of start-up");
    for (const StepText& text : stepTexts()) {
        const char* result = text.step < failure.step ? "passed" : "not reached";
        writer.row(text.title, text.step == failure.step ? "STOPPED HERE" : result);
    }
}

void addRenderer(ReportWriter& writer, const Renderer& renderer)
{
    writer.section("OpenGL renderer");
    if (!renderer.usable) {
        writer.row("Usable", "no: " + renderer.problem);
        return;
    }
    writer.row("Renderer", renderer.renderer);
    writer.row("Vendor", renderer.vendor);
    writer.row("Version", renderer.version);
    writer.row("Window system", renderer.windowSystem);
    writer.row("Vendor id of the GPU", renderer.adapterVendorId
                                           ? hex(*renderer.adapterVendorId)
                                           : "unknown; cannot be derived from these texts");
    writer.row("GL_ARB_sync", yesOrNo(renderer.syncObjects));
}

void addLoader(ReportWriter& writer, const Loader& loader)
{
    writer.section("OpenCL library");
    writer.row("Loaded", loader.loaded ? loader.file : "no");
    if (!loader.problem.empty())
        writer.row("Problem", loader.problem);
    if (!loader.missingCore.empty())
        writer.row("Missing, always required", commaList(loader.missingCore));
    if (loader.loaded && !loader.missingSharing.empty())
        writer.row("Missing, required for sharing", commaList(loader.missingSharing));
}

std::string verdict(const std::string& rejection)
{
    return rejection.empty() ? "accepted" : "not accepted: " + rejection;
}

void addDevice(ReportWriter& writer, const Diagnostics& diagnostics, const Platform& platform,
               const Device& device)
{
    writer.section("  Device: " + device.name);
    writer.row("Verdict", verdict(deviceRejection(diagnostics, platform, device)));
    writer.row("Type", deviceTypeName(device.type));
    writer.row("Vendor", device.vendor + (device.vendorId ? ", id " + hex(*device.vendorId) : ""));
    writer.row("Version, driver", device.version + ", " + device.driverVersion);
    writer.row("Compute units", std::to_string(device.computeUnits));
    writer.row("Shares with the OpenGL context", yesOrNo(device.sharesWithRenderer));
    writer.row("Drives the OpenGL context", yesOrNo(device.drivesRenderer));
    writer.row("Available", yesOrNo(device.available));
    writer.row("Double precision", yesOrNo(device.doublePrecision));
    for (const Extension& extension : kRelevantExtensions)
        writer.row(extension.name, yesOrNo(listsExtension(device.extensions, extension.name)));
}

void addPlatforms(ReportWriter& writer, const Diagnostics& diagnostics)
{
    if (diagnostics.loader.loaded && diagnostics.platforms.empty()) {
        writer.section("Platforms");
        writer.paragraph("There is none: " + describeStatus(diagnostics.platformStatus) + ".");
    }
    for (const Platform& platform : diagnostics.platforms) {
        writer.section("Platform: " + platform.name);
        writer.row("Verdict", verdict(platformRejection(diagnostics, platform)));
        writer.row("Vendor", platform.vendor);
        writer.row("Version", platform.version);
        for (const Extension& extension : kRelevantExtensions)
            writer.row(extension.name,
                       yesOrNo(listsExtension(platform.extensions, extension.name)) + " (" +
                           extension.purpose + ")");
        for (const Device& device : platform.devices)
            addDevice(writer, diagnostics, platform, device);
    }
}

void addDecisions(ReportWriter& writer, const Explanation& explanation)
{
    if (explanation.decisions.empty())
        return;
    writer.section("Decisions of start-up");
    for (const Decision& decision : explanation.decisions)
        writer.row(decision.title, decision.value + ", because " + decision.reason + ".");
    const std::string pair = rendererDeviceMismatch(explanation.diagnostics);
    if (!pair.empty())
        writer.row("Note", pair + ".");
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

void addVariables(ReportWriter& writer, const Explanation& explanation)
{
    writer.section("Environment variables that are set");
    if (explanation.variables.empty())
        writer.paragraph("None that is relevant.");
    for (const VariableReport& report : explanation.variables) {
        std::string text = effectText(report.effect) + report.explanation + ".";
        if (!report.suggestion.empty())
            text += " Probably " + report.suggestion + " is meant.";
        writer.paragraph(report.name + "=" + report.value);
        writer.row("", text);
    }
}

void addSelfTest(ReportWriter& writer, const SelfTest& test)
{
    writer.section("Self-test: a shared buffer of " + std::to_string(test.vertices) + " vertices");
    writer.row("Result", test.passed
                             ? "passed in " + std::to_string(test.evaluations) + " evaluations"
                             : "FAILED: " + test.problem);
    if (test.status != CL_SUCCESS)
        writer.row("Status", describeStatus(test.status));
    if (!test.passed) {
        writer.row("What helps", kSelfTestRemedy);
        return;
    }
    writer.row("Building the kernel", milliseconds(test.times.kernelBuild));
    writer.row("First evaluation", milliseconds(test.times.firstEvaluation));
    writer.row("Evaluation, median", milliseconds(test.times.evaluation));
    writer.row("Acquire, waited for", milliseconds(test.times.acquire));
    writer.row("Kernel, waited for", milliseconds(test.times.kernel));
    writer.row("Release, waited for", milliseconds(test.times.release));
    writer.row("OpenGL reads the result", milliseconds(test.times.read));
}

void addWarnings(ReportWriter& writer, const std::string& title,
                 const std::vector<Warning>& warnings)
{
    if (warnings.empty())
        return;
    writer.section(title);
    for (const Warning& warning : warnings) {
        if (warning.status != CL_SUCCESS)
            writer.row("OpenCL error", describeStatus(warning.status));
        else
            writer.quote(warning.text);
    }
}

} // namespace

std::string textReport(const Explanation& explanation)
{
    const Diagnostics& diagnostics = explanation.diagnostics;
    ReportWriter writer;
    writer.section(explanation.summary);
    if (explanation.failure)
        addFailure(writer, *explanation.failure);
    addRenderer(writer, diagnostics.renderer);
    addLoader(writer, diagnostics.loader);
    addPlatforms(writer, diagnostics);
    addDecisions(writer, explanation);
    addVariables(writer, explanation);
    if (diagnostics.selfTest)
        addSelfTest(writer, *diagnostics.selfTest);
    addWarnings(writer, "Failing OpenCL calls during start-up", diagnostics.startUp.warnings);
    if (diagnostics.selfTest)
        addWarnings(writer, "Failing OpenCL calls during the self-test",
                    diagnostics.selfTest->warnings);
    if (diagnostics.startUp.attempted) {
        writer.section("Output of start-up");
        writer.quote(diagnostics.startUp.output);
    }
    return writer.text();
}

} // namespace info
