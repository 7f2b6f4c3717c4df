#include "tools/info/report/JsonReport.h"

#include "tools/info/report/Extensions.h"
#include "tools/info/rules/Verdicts.h"
#include "tools/info/text/StatusCodes.h"
#include "tools/info/text/TextFormatting.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace info {
namespace {

QString text(const std::string& value)
{
    return QString::fromStdString(value);
}

QJsonValue orNull(const std::string& value)
{
    return value.empty() ? QJsonValue() : QJsonValue(text(value));
}

QJsonValue orNull(const std::optional<unsigned>& value)
{
    return value ? QJsonValue(static_cast<qint64>(*value)) : QJsonValue();
}

template <typename Items, typename Convert>
QJsonArray arrayOf(const Items& items, Convert convert)
{
    QJsonArray array;
    for (const auto& item : items)
        array.append(convert(item));
    return array;
}

QJsonValue statusObject(std::optional<int> code)
{
    if (!code || *code == CL_SUCCESS)
        return {};
    return QJsonObject{{"code", *code},
                       {"name", orNull(statusName(*code))},
                       {"meaning", orNull(statusMeaning(*code))}};
}

QJsonObject warningObject(const Warning& warning)
{
    return {{"text", text(warning.text)}, {"status", statusObject(warning.status)}};
}

QJsonValue failureObject(const std::optional<StartUpFailure>& failure)
{
    if (!failure)
        return {};
    return QJsonObject{{"step", stepText(failure->step).id},
                       {"reason", text(failure->reason)},
                       {"remedy", text(failure->remedy)},
                       {"status", statusObject(failure->status)}};
}

QJsonObject rendererObject(const Renderer& renderer)
{
    return {{"usable", renderer.usable},
            {"problem", orNull(renderer.problem)},
            {"vendor", text(renderer.vendor)},
            {"renderer", text(renderer.renderer)},
            {"version", text(renderer.version)},
            {"windowSystem", text(renderer.windowSystem)},
            {"vendorId", orNull(renderer.adapterVendorId)},
            {"syncObjects", renderer.syncObjects}};
}

QJsonObject loaderObject(const Loader& loader)
{
    return {{"loaded", loader.loaded},
            {"file", orNull(loader.file)},
            {"problem", orNull(loader.problem)},
            {"missingLayers", arrayOf(loader.missingLayers, text)},
            {"missingCore", arrayOf(loader.missingCore, text)},
            {"missingSharing", arrayOf(loader.missingSharing, text)}};
}

QJsonObject extensionsObject(const std::string& extensions)
{
    QJsonObject object;
    for (const Extension& extension : kRelevantExtensions)
        object.insert(extension.name, listsExtension(extensions, extension.name));
    return object;
}

QJsonObject deviceObject(const Diagnostics& diagnostics, const Platform& platform,
                         const Device& device)
{
    const std::string rejection = deviceRejection(diagnostics, platform, device);
    return {{"accepted", rejection.empty()},
            {"rejection", orNull(rejection)},
            {"name", text(device.name)},
            {"vendor", text(device.vendor)},
            {"vendorId", orNull(device.vendorId)},
            {"version", text(device.version)},
            {"driverVersion", text(device.driverVersion)},
            {"type", text(deviceTypeName(device.type))},
            {"computeUnits", static_cast<qint64>(device.computeUnits)},
            {"sharesWithRenderer", device.sharesWithRenderer},
            {"drivesRenderer", device.drivesRenderer},
            {"available", device.available},
            {"doublePrecision", device.doublePrecision},
            {"extensions", extensionsObject(device.extensions)}};
}

QJsonObject platformObject(const Diagnostics& diagnostics, const Platform& platform)
{
    const std::string rejection = platformRejection(diagnostics, platform);
    return {{"accepted", rejection.empty()},
            {"rejection", orNull(rejection)},
            {"name", text(platform.name)},
            {"vendor", text(platform.vendor)},
            {"version", text(platform.version)},
            {"extensions", extensionsObject(platform.extensions)},
            {"devices", arrayOf(platform.devices, [&](const Device& device) {
                 return deviceObject(diagnostics, platform, device);
             })}};
}

QJsonObject decisionObject(const Decision& decision)
{
    return {{"id", text(decision.id)},
            {"value", text(decision.value)},
            {"reason", text(decision.reason)},
            {"variable", orNull(decision.variable)}};
}

QJsonObject variableObject(const VariableReport& report)
{
    return {{"name", text(report.name)},
            {"value", text(report.value)},
            {"effect", effectId(report.effect)},
            {"explanation", text(report.explanation)},
            {"suggestion", orNull(report.suggestion)}};
}

QJsonObject startUpObject(const StartUp& startUp)
{
    return {{"attempted", startUp.attempted},
            {"vendorId", static_cast<qint64>(startUp.vendorId)},
            {"output", text(startUp.output)},
            {"warnings", arrayOf(startUp.warnings, warningObject)}};
}

QJsonValue timesObject(const SelfTest& test)
{
    if (!test.passed)
        return {};
    return QJsonObject{{"kernelBuild", test.times.kernelBuild},
                       {"firstEvaluation", test.times.firstEvaluation},
                       {"evaluation", test.times.evaluation},
                       {"acquire", test.times.acquire},
                       {"kernel", test.times.kernel},
                       {"release", test.times.release},
                       {"read", test.times.read}};
}

QJsonValue selfTestObject(const std::optional<SelfTest>& test)
{
    if (!test)
        return {};
    return QJsonObject{{"passed", test->passed},
                       {"problem", orNull(test->problem)},
                       {"status", statusObject(test->status)},
                       {"vertices", static_cast<qint64>(test->vertices)},
                       {"evaluations", test->evaluations},
                       {"milliseconds", timesObject(*test)},
                       {"warnings", arrayOf(test->warnings, warningObject)}};
}

} // namespace

std::string jsonReport(const Explanation& explanation)
{
    const Diagnostics& diagnostics = explanation.diagnostics;
    const QJsonObject report{
        {"format", kJsonFormat},
        {"exitCode", static_cast<int>(explanation.exitCode)},
        {"summary", text(explanation.summary)},
        {"on", !explanation.failure},
        {"stop", failureObject(explanation.failure)},
        {"renderer", rendererObject(diagnostics.renderer)},
        {"rendererBesideDevice", orNull(rendererDeviceMismatch(diagnostics))},
        {"loader", loaderObject(diagnostics.loader)},
        {"platformsStatus", statusObject(diagnostics.platformStatus)},
        {"platforms",
         arrayOf(diagnostics.platforms,
                 [&](const Platform& platform) { return platformObject(diagnostics, platform); })},
        {"decisions", arrayOf(explanation.decisions, decisionObject)},
        {"variables", arrayOf(explanation.variables, variableObject)},
        {"startUp", startUpObject(diagnostics.startUp)},
        {"selfTest", selfTestObject(diagnostics.selfTest)},
    };
    return QJsonDocument(report).toJson(QJsonDocument::Indented).toStdString();
}

} // namespace info
