// SPDX-License-Identifier: LGPL-2.1-or-later
#include "jsondocument.h"

#include "inputfile.h"
#include "schemaexplanation.h"

#include <QtCore/QJsonDocument>
#include <QtCore/QStringList>
#include <valijson/adapters/qtjson_adapter.hpp>
#include <valijson/schema.hpp>
#include <valijson/schema_parser.hpp>
#include <valijson/validation_results.hpp>
#include <valijson/validator.hpp>

namespace Corvane
{

namespace
{

// Far beyond any document that a person writes; keeps a mistaken "/dev/zero" from filling the memory.
constexpr qint64 largestDocument = 16 * 1024 * 1024;

JsonDocument failure(const QString &name, const QString &reason)
{
    return {{}, QStringLiteral("%1: %2").arg(name, reason)};
}

QString place(const QByteArray &text, int offset)
{
    // The parser reports the offset behind the character that it stumbled over.
    const QByteArray before = text.left(offset - 1);
    const int lineStart = before.lastIndexOf('\n') + 1;
    const int column = QString::fromUtf8(before.mid(lineStart)).size() + 1;
    return QStringLiteral("%1:%2").arg(before.count('\n') + 1).arg(column);
}

// The validator writes a path as "<root>", "[calls]", "[0]".
QStringList pathOf(const std::vector<std::string> &context)
{
    QStringList path;
    for (std::size_t i = 1; i < context.size(); ++i)
        path.append(QString::fromStdString(context[i].substr(1, context[i].size() - 2)));
    return path;
}

// Errors come innermost first, so the first one is the cause and the others repeat it for the containers.
QString explain(const valijson::ValidationResults::Error &error, const QJsonObject &schema,
                const QJsonObject &object)
{
    const QStringList path = pathOf(error.context);
    const QString explanation = explainViolation(schema, object, path);
    if (!explanation.isEmpty())
        return explanation;
    const QString description = QString::fromStdString(error.description);
    return path.isEmpty() ? description : jsonPointer(path) + QLatin1String(": ") + description;
}

QString violation(const QJsonObject &schema, const QJsonObject &object)
{
    valijson::Schema compiled;
    valijson::SchemaParser().populateSchema(valijson::adapters::QtJsonAdapter(schema), compiled);
    valijson::ValidationResults results;
    valijson::Validator validator;
    if (validator.validate(compiled, valijson::adapters::QtJsonAdapter(object), &results))
        return QString();
    return explain(*results.begin(), schema, object);
}

JsonDocument parse(const QString &name, const QByteArray &text, const QByteArray &schema)
{
    if (text.trimmed().isEmpty())
        return failure(name, QStringLiteral("is empty, must be a JSON object"));
    QJsonParseError error;
    const QJsonDocument document = QJsonDocument::fromJson(text, &error);
    if (error.error != QJsonParseError::NoError)
        return failure(name + QLatin1Char(':') + place(text, error.offset), error.errorString());
    if (!document.isObject())
        return failure(name, QStringLiteral("must be a JSON object, is an array"));

    const QString wrong = violation(QJsonDocument::fromJson(schema).object(), document.object());
    return wrong.isEmpty() ? JsonDocument{document.object(), {}} : failure(name, wrong);
}

} // namespace

JsonDocument readJsonDocument(const QString &fileName, const QByteArray &schema)
{
    const InputFile input = readInputFile(fileName, largestDocument);
    return input.error.isEmpty() ? parse(input.name, input.content, schema)
                                 : failure(input.name, input.error);
}

} // namespace Corvane
