// SPDX-License-Identifier: LGPL-2.1-or-later
#include "profile.h"

#include "component.h"

#include <inputfile.h>
#include <jsondocument.h>

#include <QtCore/QFile>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String builtInProfile(":/devices/dual-sim.json");
constexpr int longestHostName = 63;

QByteArray schema()
{
    QFile file(QStringLiteral(":/schema/profile.schema.json"));
    if (!file.open(QIODevice::ReadOnly))
        qFatal("the schema of device profiles is not built in");
    return file.readAll();
}

/** @p object with the members of @p defaults that it lacks, at every depth of objects. */
QJsonObject completed(QJsonObject object, const QJsonObject &defaults)
{
    for (auto member = defaults.begin(); member != defaults.end(); ++member) {
        const QJsonValue present = object.value(member.key());
        if (present.isUndefined())
            object.insert(member.key(), member.value());
        else if (present.isObject())
            object.insert(member.key(), completed(present.toObject(), member.value().toObject()));
    }
    return object;
}

} // namespace

QString Profile::hostName() const
{
    QString host;
    const QString lowered = name().toLower();
    for (const QChar c : lowered) {
        const bool isAllowed = (c >= QLatin1Char('a') && c <= QLatin1Char('z'))
            || (c >= QLatin1Char('0') && c <= QLatin1Char('9'));
        if (isAllowed)
            host += c;
        else if (!host.isEmpty() && !host.endsWith(QLatin1Char('-')))
            host += QLatin1Char('-');
    }
    host.truncate(longestHostName);
    while (host.endsWith(QLatin1Char('-')))
        host.chop(1);
    return host.isEmpty() ? QStringLiteral("phone") : host;
}

Profile readProfile(const QString &fileName)
{
    const JsonDocument builtIn = readJsonDocument(builtInProfile, schema());
    Q_ASSERT(builtIn.isValid());
    if (fileName.isEmpty())
        return {builtIn.object, QString()};

    const JsonDocument document = readJsonDocument(fileName, schema());
    if (!document.isValid())
        return {{}, document.error};

    const QJsonObject profile = completed(document.object, builtIn.object);
    for (const ComponentType &type : ComponentRegistration::all()) {
        const QString problem = type.problemOf(profile);
        if (!problem.isEmpty())
            return {{}, inputFileName(fileName) + QStringLiteral(": ") + problem};
    }
    return {profile, QString()};
}

} // namespace Simulator
} // namespace Corvane
