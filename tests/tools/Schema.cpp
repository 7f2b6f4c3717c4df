#include "Schema.h"

#include <algorithm>

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

bool isOfType(const QJsonValue& value, const QString& type)
{
    if (type == "integer")
        return value.isDouble() && value == QJsonValue(value.toInteger());
    // As they stand in QJsonValue::Type.
    constexpr const char* kTypes[] = {"null", "boolean", "number", "string", "array", "object"};
    return type == kTypes[value.type()];
}

struct Checker {
    QJsonObject definitions;
    std::vector<std::string> violations;

    void expect(bool right, const QString& where, const char* wrong)
    {
        if (!right)
            violations.push_back((where + wrong).toStdString());
    }

    void check(const QString& where, QJsonObject schema, const QJsonValue& value)
    {
        if (schema.contains("$ref"))
            schema = definitions[schema["$ref"].toString().section('/', -1)].toObject();
        expect(!schema.isEmpty(), where, " is not described");
        checkValue(where, schema, value);
        if (value.isObject())
            checkMembers(where, schema, value.toObject());
        int index = 0;
        for (const QJsonValue item : value.toArray())
            check(where + "/" + QString::number(index++), schema["items"].toObject(), item);
    }

    void checkValue(const QString& where, const QJsonObject& schema, const QJsonValue& value)
    {
        const auto fits = [&](const char* keyword, const auto& fitsOne) {
            const QJsonValue allowed = schema[keyword];
            const QJsonArray list = allowed.isArray() ? allowed.toArray() : QJsonArray{allowed};
            return allowed.isUndefined() || std::any_of(list.begin(), list.end(), fitsOne);
        };
        const auto equals = [&](const QJsonValue& allowed) { return value == allowed; };
        expect(fits("type", [&](auto type) { return isOfType(value, type.toString()); }), where,
               " is of the wrong type");
        expect(fits("enum", equals) && fits("const", equals), where, " has a wrong value");
    }

    void checkMembers(const QString& where, const QJsonObject& schema, const QJsonObject& object)
    {
        for (const QJsonValue name : schema["required"].toArray())
            expect(object.contains(name.toString()), where + "/" + name.toString(), " is missing");
        const QJsonObject properties = schema["properties"].toObject();
        for (auto member = object.begin(); member != object.end(); ++member) {
            const QJsonValue own = properties.value(member.key());
            check(where + "/" + member.key(),
                  (own.isUndefined() ? schema["additionalProperties"] : own).toObject(),
                  member.value());
        }
    }
};

} // namespace

std::vector<std::string> schemaViolations(const char* schemaFile, const QJsonValue& value)
{
    QFile file(schemaFile);
    if (!file.open(QIODevice::ReadOnly))
        return {"the schema cannot be read"};
    const QJsonObject root = QJsonDocument::fromJson(file.readAll()).object();
    Checker checker{root["$defs"].toObject(), {}};
    checker.check("", root, value);
    return checker.violations;
}
