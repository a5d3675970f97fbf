// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "sandbox.h"
#include "truststore.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QJsonArray>

#include <filesystem>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String authoritiesFolder(":/authorities/");

/** The certificate of one of the authorities that are built in; empty when there is no such one. */
QByteArray certificateOf(const QString &authority)
{
    QFile file(authoritiesFolder + authority + QLatin1String(".pem"));
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

QJsonObject partOf(const QJsonObject &profile)
{
    return profile.value(QLatin1String("certificates")).toObject();
}

/** The content of the file that @p entry describes. */
QByteArray contentOf(const QJsonObject &entry)
{
    return entry.contains(QLatin1String("authority"))
        ? certificateOf(entry.value(QLatin1String("authority")).toString())
        : entry.value(QLatin1String("content")).toString().toUtf8();
}

/** Adds the files that @p entries describe to @p folder, and returns the certificates in them. */
QByteArrayList addFolder(const QLatin1String &folder, const QJsonArray &entries, PhoneFiles &files)
{
    files.writableFolders.push_back(folder.data());
    QByteArrayList certificates;
    for (const QJsonValue &value : entries) {
        const QJsonObject entry = value.toObject();
        const QByteArray content = contentOf(entry);
        const QString path = folder + QLatin1Char('/') + entry.value(QLatin1String("file")).toString();
        files.files[path.toStdString()] = content.toStdString();
        certificates += TrustStore::certificatesIn(content);
    }
    return certificates;
}

void addFiles(const QJsonObject &profile, PhoneFiles &files)
{
    const QJsonObject part = partOf(profile);
    QByteArray system;
    const QJsonArray authorities = part.value(QLatin1String("system")).toArray();
    for (const QJsonValue &authority : authorities)
        system += certificateOf(authority.toString());
    files.files[TrustStore::systemBundle.data()] = system.toStdString();

    const QByteArrayList anchors
        = addFolder(TrustStore::anchorsFolder, part.value(QLatin1String("installed")).toArray(), files);
    const QByteArrayList distrusted
        = addFolder(TrustStore::blacklistFolder, part.value(QLatin1String("blacklisted")).toArray(), files);
    files.writableFolders.push_back(TrustStore::extractedFolder.data());
    files.files[TrustStore::extractedBundle.data()]
        = TrustStore::extracted(TrustStore::certificatesIn(system) + anchors, distrusted).toStdString();
    // Where TLS libraries look; it hides the authorities that the machine trusts.
    files.links["/etc/ssl/certs"] = TrustStore::extractedFolder.data();
    files.links["/usr/libexec/mdm-certificate"]
        = std::filesystem::read_symlink("/proc/self/exe").parent_path() / "corvane-mdm-certificate";
}

/** What is wrong with the entry at @p pointer. */
QString problemOf(const QString &pointer, const QJsonObject &entry)
{
    const bool hasAuthority = entry.contains(QLatin1String("authority"));
    if (hasAuthority == entry.contains(QLatin1String("content")))
        return pointer + QStringLiteral(": must have either authority or content");
    if (!hasAuthority || !contentOf(entry).isEmpty())
        return QString();
    QStringList known = QDir(authoritiesFolder).entryList(QDir::Files, QDir::Name);
    known.replaceInStrings(QStringLiteral(".pem"), QString());
    return QStringLiteral("%1/authority: must be one of %2; is %3")
        .arg(pointer, known.join(QLatin1String(", ")), entry.value(QLatin1String("authority")).toString());
}

QString problemOfProfile(const QJsonObject &profile)
{
    const QJsonObject part = partOf(profile);
    const QJsonArray system = part.value(QLatin1String("system")).toArray();
    for (int i = 0; i < system.size(); ++i) {
        const QString problem = problemOf(QStringLiteral("/certificates/system/%1").arg(i),
                                          {{QStringLiteral("authority"), system.at(i)}});
        if (!problem.isEmpty())
            return problem;
    }
    for (const QLatin1String list : {QLatin1String("installed"), QLatin1String("blacklisted")}) {
        const QJsonArray entries = part.value(list).toArray();
        for (int i = 0; i < entries.size(); ++i) {
            const QString problem
                = problemOf(QStringLiteral("/certificates/%1/%2").arg(list).arg(i), entries.at(i).toObject());
            if (!problem.isEmpty())
                return problem;
        }
    }
    return QString();
}

/** Tells what is in the trust store, which no service speaks for; files are all that there is of it. */
class Certificates : public Component
{
public:
    void attach(Service &) override { }
    void detach() override { }
    void describe(QJsonObject &state) const override;
};

void Certificates::describe(QJsonObject &state) const
{
    const auto namesIn = [](const QLatin1String &folder) {
        return QJsonArray::fromStringList(QDir(folder).entryList(QDir::Files, QDir::Name));
    };
    QFile bundle(TrustStore::extractedBundle);
    const QByteArray extracted = bundle.open(QIODevice::ReadOnly) ? bundle.readAll() : QByteArray();
    state.insert(QStringLiteral("certificates"),
                 QJsonObject{
                     {QStringLiteral("installed"), namesIn(TrustStore::anchorsFolder)},
                     {QStringLiteral("blacklisted"), namesIn(TrustStore::blacklistFolder)},
                     {QStringLiteral("trusted"), TrustStore::certificatesIn(extracted).size()},
                 });
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &, Phone &) { return std::make_unique<Certificates>(); },
    problemOfProfile,
    addFiles,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
