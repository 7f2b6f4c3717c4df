// vyra-opencl-info as a process.
#pragma once

#include <string>
#include <vector>

#include <QByteArray>
#include <QJsonObject>
#include <QJsonValue>

struct Setting {
    const char* name;
    const char* value; // null: removed
};

struct InfoRun {
    int exitCode = -1; // -1: it crashed or did not end
    QByteArray output;
    QByteArray errors;

    QJsonObject json() const;
};

// Runs the program in this process's environment, without the variables that steer the library or
// its OpenCL, plus `settings`.
InfoRun runInfo(const std::vector<Setting>& settings, const std::vector<std::string>& arguments);

// The value at a path such as "platforms.0.vendor"; undefined where there is none.
QJsonValue valueAt(const QJsonValue& json, const std::string& path);
