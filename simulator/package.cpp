// SPDX-License-Identifier: LGPL-2.1-or-later
#include "package.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String defaultRelease("1");

// One transparent pixel.
const char pixel[]
    = "iVBORw0KGgoAAAANSUhEUgAAAAEAAAABCAYAAAAfFcSJAAAAC0lEQVR42mNgAAIAAAUAAen63NgAAAAASUVORK5CYII=";

QStringList strings(const QJsonValue &array)
{
    QStringList list;
    const QJsonArray values = array.toArray();
    for (const QJsonValue &value : values)
        list << value.toString();
    return list;
}

/** The desktop entry of @p package and the icon that it names. */
std::map<QString, QByteArray> filesOf(const QString &package, const QJsonObject &application)
{
    const QString icon = application.value(QLatin1String("icon")).toString();
    QStringList lines{QStringLiteral("[Desktop Entry]"), QStringLiteral("Type=Application"),
                      QStringLiteral("Name=") + application.value(QLatin1String("name")).toString(),
                      QStringLiteral("Exec=/usr/bin/") + package};
    if (!icon.isEmpty())
        lines << QStringLiteral("Icon=") + icon;
    if (application.value(QLatin1String("noDisplay")).toBool())
        lines << QStringLiteral("NoDisplay=true");
    const QStringList environments = strings(application.value(QLatin1String("notShowIn")));
    if (!environments.isEmpty())
        lines << QStringLiteral("NotShowIn=%1;").arg(environments.join(QLatin1Char(';')));

    std::map<QString, QByteArray> files;
    files[QStringLiteral("/usr/share/applications/%1.desktop").arg(package)]
        = (lines.join(QLatin1Char('\n')) + QLatin1Char('\n')).toUtf8();
    if (!icon.isEmpty()) {
        const QString file = icon.startsWith(QLatin1Char('/'))
            ? icon
            : QStringLiteral("/usr/share/icons/hicolor/128x128/apps/%1.png").arg(icon);
        files[file] = QByteArray::fromBase64(pixel);
    }
    return files;
}

} // namespace

Package Package::fromJson(const QJsonObject &json)
{
    Package package;
    package.json = json;
    package.name = json.value(QLatin1String("name")).toString();
    package.version = json.value(QLatin1String("version")).toString();
    package.release = json.value(QLatin1String("release")).toString(defaultRelease);
    package.vendor = json.value(QLatin1String("vendor")).toString();
    package.summary = json.value(QLatin1String("summary")).toString(package.name);
    package.needs = strings(json.value(QLatin1String("requires")));
    package.essential = json.value(QLatin1String("essential")).toBool();
    package.automatic = json.value(QLatin1String("automatic")).toBool();
    package.trusted = json.value(QLatin1String("trusted")).toBool(true);
    package.installFails = json.value(QLatin1String("installFails")).toString();
    package.removeFails = json.value(QLatin1String("removeFails")).toString();
    const QJsonValue application = json.value(QLatin1String("application"));
    if (application.isObject())
        package.files = filesOf(package.name, application.toObject());
    const QStringList files = strings(json.value(QLatin1String("files")));
    for (const QString &file : files)
        package.files[file] = QStringLiteral("of %1\n").arg(package.name).toUtf8();
    return package;
}

std::vector<Package> packagesFrom(const QJsonArray &json)
{
    std::vector<Package> packages;
    for (const QJsonValue &package : json)
        packages.push_back(Package::fromJson(package.toObject()));
    return packages;
}

} // namespace Simulator
} // namespace Corvane
