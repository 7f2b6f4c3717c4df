#include "InfoProcess.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QProcess>

namespace {

// Generous: kernels are compiled, perhaps under a sanitizer and beside other tests.
constexpr int kTimeoutMs = 100000;

bool steers(const QString& name)
{
    return name.startsWith("VYRA_") || name.startsWith("GLSHARE_") || name == "OPENCL_LAYERS";
}

QProcessEnvironment environmentWith(const std::vector<Setting>& settings)
{
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    for (const QString& name : environment.keys()) {
        if (steers(name))
            environment.remove(name);
    }
    for (const Setting& setting : settings) {
        if (setting.value)
            environment.insert(setting.name, setting.value);
        else
            environment.remove(setting.name);
    }
    return environment;
}

} // namespace

QJsonObject InfoRun::json() const
{
    return QJsonDocument::fromJson(output).object();
}

InfoRun runInfo(const std::vector<Setting>& settings, const std::vector<std::string>& arguments)
{
    QStringList list;
    for (const std::string& argument : arguments)
        list.append(QString::fromStdString(argument));
    QProcess process;
    process.setProcessEnvironment(environmentWith(settings));
    process.start(INFO_PROGRAM, list);
    InfoRun run;
    if (!process.waitForFinished(kTimeoutMs)) {
        process.kill();
        process.waitForFinished();
    } else if (process.exitStatus() == QProcess::NormalExit) {
        run.exitCode = process.exitCode();
    }
    run.output = process.readAllStandardOutput();
    run.errors = process.readAllStandardError();
    return run;
}

QJsonValue valueAt(const QJsonValue& json, const std::string& path)
{
    QJsonValue value = json;
    for (const QString& part : QString::fromStdString(path).split('.'))
        value = value.isArray() ? value.toArray().at(part.toInt()) : value[part];
    return value;
}
