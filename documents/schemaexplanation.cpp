// SPDX-License-Identifier: LGPL-2.1-or-later
#include "schemaexplanation.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>

namespace Corvane
{

namespace
{

QJsonValue elementOf(const QJsonValue &container, const QString &step)
{
    return container.isArray() ? container.toArray().at(step.toInt()) : container.toObject().value(step);
}

QJsonObject resolveReference(const QJsonObject &schema, const QJsonObject &node)
{
    const QString reference = node.value(QLatin1String("$ref")).toString();
    if (!reference.startsWith(QLatin1String("#/")))
        return node;
    QJsonValue target = schema;
    const QStringList steps = reference.mid(2).split(QLatin1Char('/'));
    for (const QString &step : steps)
        target = elementOf(target, step);
    return resolveReference(schema, target.toObject());
}

QJsonObject schemaOfMember(const QJsonObject &node, const QString &name)
{
    const QJsonObject properties = node.value(QLatin1String("properties")).toObject();
    return properties.value(name).toObject(node.value(QLatin1String("additionalProperties")).toObject());
}

QJsonObject schemaOfItem(const QJsonObject &node, int index)
{
    const QJsonValue items = node.value(QLatin1String("items"));
    return items.isArray() ? items.toArray().at(index).toObject() : items.toObject();
}

QString written(const QJsonValue &value)
{
    // Only containers make documents of their own, so a scalar is written as the one element of an array.
    const QByteArray text = QJsonDocument(QJsonArray{value}).toJson(QJsonDocument::Compact);
    return QString::fromUtf8(text.mid(1, text.size() - 2));
}

QString writtenList(const QStringList &names)
{
    QStringList quoted;
    for (const QString &name : names)
        quoted.append(written(name));
    return quoted.join(QLatin1String(", "));
}

QString found(const QJsonValue &value)
{
    if (value.isObject())
        return QStringLiteral("is an object");
    if (value.isArray())
        return QStringLiteral("is an array");
    return QLatin1String("is ") + written(value);
}

/** The first member of @p object that @p node does not allow; null when there is none. */
QString unknownMember(const QJsonObject &node, const QJsonObject &object)
{
    const QJsonValue additional = node.value(QLatin1String("additionalProperties"));
    if (!additional.isBool() || additional.toBool())
        return QString();
    const QJsonObject allowed = node.value(QLatin1String("properties")).toObject();
    const QStringList present = object.keys();
    for (const QString &name : present) {
        if (!allowed.contains(name))
            return name;
    }
    return QString();
}

QString missingMember(const QJsonObject &node, const QJsonObject &object)
{
    const QJsonArray required = node.value(QLatin1String("required")).toArray();
    for (const QJsonValue &name : required) {
        if (!object.contains(name.toString()))
            return QStringLiteral("must have a member ") + written(name);
    }
    return QString();
}

QStringList typesOf(const QJsonObject &node)
{
    const QJsonValue type = node.value(QLatin1String("type"));
    return type.isArray() ? type.toVariant().toStringList() : QStringList{type.toString()};
}

QString limits(const QJsonObject &node)
{
    struct Limit {
        QLatin1String keyword;
        QString words;
    };
    static const Limit known[] = {
        {QLatin1String("minimum"), QStringLiteral("at least %1")},
        {QLatin1String("exclusiveMinimum"), QStringLiteral("more than %1")},
        {QLatin1String("maximum"), QStringLiteral("at most %1")},
        {QLatin1String("exclusiveMaximum"), QStringLiteral("less than %1")},
        {QLatin1String("minLength"), QStringLiteral("at least %1 character(s)")},
        {QLatin1String("maxLength"), QStringLiteral("at most %1 character(s)")},
        {QLatin1String("minItems"), QStringLiteral("at least %1 element(s)")},
        {QLatin1String("maxItems"), QStringLiteral("at most %1 element(s)")},
        {QLatin1String("pattern"), QStringLiteral("the form %1")},
    };
    QStringList phrases;
    for (const Limit &limit : known) {
        if (node.contains(limit.keyword))
            phrases.append(limit.words.arg(node.value(limit.keyword).toVariant().toString()));
    }
    return phrases.join(QLatin1String(" and "));
}

QString typeInWords(const QString &type)
{
    if (type == QLatin1String("null"))
        return type;
    const bool vowel = QStringLiteral("aio").contains(type.at(0));
    return (vowel ? QLatin1String("an ") : QLatin1String("a ")) + type;
}

QString expectation(const QJsonObject &node)
{
    if (node.contains(QLatin1String("const")))
        return written(node.value(QLatin1String("const")));
    const QJsonArray choices = node.value(QLatin1String("enum")).toArray();
    if (!choices.isEmpty()) {
        QStringList texts;
        for (const QJsonValue &choice : choices)
            texts.append(written(choice));
        return QLatin1String("one of ") + texts.join(QLatin1String(", "));
    }
    if (!node.contains(QLatin1String("type")))
        return QString();
    QStringList types;
    const QStringList names = typesOf(node);
    for (const QString &name : names)
        types.append(typeInWords(name));
    QString words = types.join(QLatin1String(" or "));
    const QString bounds = limits(node);
    if (!bounds.isEmpty())
        words += QLatin1String(" of ") + bounds;
    if (node.value(QLatin1String("uniqueItems")).toBool())
        words += QLatin1String(" without repetitions");
    // A pattern alone tells people little; its description says what it stands for.
    const QString description = node.value(QLatin1String("description")).toString();
    if (node.contains(QLatin1String("pattern")) && !description.isEmpty())
        words += QStringLiteral(" (%1)").arg(description);
    return words;
}

QString explainValue(const QJsonObject &node, const QJsonValue &value)
{
    if (value.isObject() && typesOf(node).contains(QLatin1String("object")))
        return missingMember(node, value.toObject());
    const QString expected = expectation(node);
    if (expected.isEmpty())
        return QString();
    // A container of the right type is wrong in what it holds.
    if (value.isArray() && typesOf(node).contains(QLatin1String("array")))
        return QLatin1String("must be ") + expected;
    return QStringLiteral("must be %1; %2").arg(expected, found(value));
}

QString atPath(const QStringList &path, const QString &explanation)
{
    if (explanation.isEmpty() || path.isEmpty())
        return explanation;
    return jsonPointer(path) + QLatin1String(": ") + explanation;
}

} // namespace

QString jsonPointer(const QStringList &path)
{
    QString pointer;
    for (QString step : path) {
        step.replace(QLatin1Char('~'), QLatin1String("~0")).replace(QLatin1Char('/'), QLatin1String("~1"));
        pointer += QLatin1Char('/') + step;
    }
    return pointer;
}

QString explainViolation(const QJsonObject &schema, const QJsonValue &document, const QStringList &path)
{
    QJsonObject node = resolveReference(schema, schema);
    QJsonValue value = document;
    for (const QString &step : path) {
        node = value.isArray() ? schemaOfItem(node, step.toInt()) : schemaOfMember(node, step);
        node = resolveReference(schema, node);
        value = elementOf(value, step);
    }
    // A slip of the keyboard explains a missing member too, so it comes first.
    const QString unknown = unknownMember(node, value.toObject());
    if (unknown.isNull())
        return atPath(path, explainValue(node, value));
    const QStringList allowed = node.value(QLatin1String("properties")).toObject().keys();
    return atPath(path + QStringList(unknown),
                  QLatin1String("unknown member; must be one of ") + writtenList(allowed));
}

} // namespace Corvane
