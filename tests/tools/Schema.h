// The part of JSON Schema that info.schema.json uses.
#pragma once

#include <string>
#include <vector>

#include <QJsonValue>

// What is wrong with `value`, one line each, by the schema in the file `schemaFile`. A member that
// a schema with "properties" does not name counts as wrong: nothing goes undocumented.
std::vector<std::string> schemaViolations(const char* schemaFile, const QJsonValue& value);
