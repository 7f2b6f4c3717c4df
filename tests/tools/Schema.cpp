#include "Schema.h"

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

QString typeName(const QJsonValue& value)
{
    switch (value.type()) {
    case QJsonValue::Null:
        return "null";
    case QJsonValue::Bool:
        return "boolean";
    case QJsonValue::Double:
        return value.toDouble() == static_cast<double>(value.toInteger()) ? "integer" : "number";
    case QJsonValue::String:
        return "string";
    case QJsonValue::Array:
        return "array";
    case QJsonValue::Object:
        return "object";
    default:
        return "undefined";
    }
}

class Checker {
public:
    explicit Checker(QJsonObject root) : fRoot(std::move(root)) {}

    void check(const QString& where, QJsonObject schema, const QJsonValue& value)
    {
        if (schema.contains("$ref"))
            schema =
                fRoot["$defs"].toObject()[schema["$ref"].toString().section('/', -1)].toObject();
        if (schema.isEmpty())
            complain(where, "has an empty schema");
        checkValue(where, schema, value);
        if (value.isObject())
            checkMembers(where, schema, value.toObject());
        int index = 0;
        for (const QJsonValue item : value.toArray())
            check(where + "/" + QString::number(index++), schema["items"].toObject(), item);
    }

    std::vector<std::string> takeViolations() { return std::move(fViolations); }

private:
    void checkValue(const QString& where, const QJsonObject& schema, const QJsonValue& value)
    {
        const QString type = typeName(value);
        const QJsonValue types = schema["type"];
        const QJsonArray allowed = types.isString() ? QJsonArray{types} : types.toArray();
        const bool isNumber = type == "integer" && allowed.contains("number");
        if (!types.isUndefined() && !allowed.contains(type) && !isNumber)
            complain(where, "is of type " + type);
        if (schema.contains("enum") && !schema["enum"].toArray().contains(value))
            complain(where, "is none of the values allowed");
        if (schema.contains("const") && schema["const"] != value)
            complain(where, "is not the one value allowed");
    }

    void checkMembers(const QString& where, const QJsonObject& schema, const QJsonObject& object)
    {
        for (const QJsonValue required : schema["required"].toArray()) {
            if (!object.contains(required.toString()))
                complain(where, "lacks " + required.toString());
        }
        const QJsonObject properties = schema["properties"].toObject();
        const QJsonObject others = schema["additionalProperties"].toObject();
        for (auto member = object.begin(); member != object.end(); ++member) {
            const QJsonObject own = properties[member.key()].toObject();
            check(where + "/" + member.key(), own.isEmpty() ? others : own, member.value());
        }
    }

    void complain(const QString& where, const QString& what)
    {
        fViolations.push_back((where + " " + what).toStdString());
    }

    QJsonObject fRoot;
    std::vector<std::string> fViolations;
};

} // namespace

std::vector<std::string> schemaViolations(const char* schemaFile, const QJsonValue& value)
{
    QFile file(schemaFile);
    if (!file.open(QIODevice::ReadOnly))
        return {"the schema cannot be read"};
    const QJsonObject root = QJsonDocument::fromJson(file.readAll()).object();
    Checker checker(root);
    checker.check("", root, value);
    return checker.takeViolations();
}
