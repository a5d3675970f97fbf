// SPDX-License-Identifier: LGPL-2.1-or-later
#include "certificatesection.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::CertificateFile;

namespace
{

const QLatin1String fileMember("file");
const QLatin1String pemMember("pem");

struct List {
    QLatin1String member;
    bool trusted;
};
const List lists[] = {{QLatin1String("trusted"), true}, {QLatin1String("distrusted"), false}};

QByteArray pemOf(const QJsonValue &entry)
{
    return entry.toObject().value(pemMember).toString().toUtf8();
}

QList<QSslCertificate> certificatesOf(const QJsonValue &entry)
{
    return QSslCertificate::fromData(pemOf(entry), QSsl::Pem);
}

QString pathOf(const List &list, const QString &fileName)
{
    return QStringLiteral("certificates.%1.%2").arg(list.member, fileName);
}

/** Certificates for reports: their subjects for people, their fingerprints otherwise. */
Setting::Value valueOf(const QList<QSslCertificate> &certificates)
{
    QStringList subjects;
    QStringList fingerprints;
    for (const QSslCertificate &certificate : certificates) {
        subjects.append(subjectOf(certificate));
        fingerprints.append(fingerprintOf(certificate));
    }
    // Their order in the file has no meaning.
    fingerprints.sort();
    return {QJsonArray::fromStringList(fingerprints),
            subjects.isEmpty() ? QStringLiteral("no certificates") : subjects.join(QLatin1Char('\n'))};
}

Setting compared(Setting setting, const QList<CertificateFile> &files, const QString &fileName)
{
    const auto file = std::find_if(files.cbegin(), files.cend(),
                                   [&](const CertificateFile &each) { return each.fileName() == fileName; });
    if (file == files.cend()) {
        setting.present = {QJsonValue::Null, QStringLiteral("no such file")};
        return setting.with(Setting::Different, QStringLiteral("write it"));
    }
    setting.present = valueOf(file->certificates());
    return setting.present.json == setting.wanted.json
        ? setting
        : setting.with(Setting::Different, QStringLiteral("replace it"));
}

} // namespace

CertificateSection::CertificateSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString CertificateSection::member() const
{
    return QStringLiteral("certificates");
}

Service CertificateSection::service() const
{
    return Service::certificateHelper();
}

QString CertificateSection::fault(const QJsonObject &wanted) const
{
    for (const List &list : lists) {
        QStringList names;
        const QJsonArray entries = wanted.value(list.member).toArray();
        for (int i = 0; i < entries.size(); ++i) {
            const QString pointer = QStringLiteral("/certificates/%1/%2/%3").arg(list.member).arg(i);
            const QString name = entries.at(i).toObject().value(fileMember).toString();
            const QString nameFault = certificateFileNameFault(name);
            if (!nameFault.isEmpty())
                return QStringLiteral("%1: %2").arg(pointer.arg(fileMember), nameFault);
            if (names.contains(name))
                return QStringLiteral("%1: must be named once").arg(pointer.arg(fileMember));
            names.append(name);
            if (certificatesOf(entries.at(i)).isEmpty())
                return QStringLiteral("%1: must hold certificates in PEM form").arg(pointer.arg(pemMember));
        }
    }
    return QString();
}

QVector<Setting> CertificateSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    for (const List &list : lists) {
        const QJsonArray entries = wanted.value(list.member).toArray();
        for (const QJsonValue &entry : entries) {
            Setting setting;
            setting.path = pathOf(list, entry.toObject().value(fileMember).toString());
            setting.wanted = valueOf(certificatesOf(entry));
            settings.append(setting);
        }
    }
    return settings;
}

Reply CertificateSection::open(const QJsonObject &)
{
    m_store = std::make_unique<TrustStore>(m_timeout);
    connect(m_store.get(), &TrustStore::changed, this, &PolicySection::drifted);
    return {};
}

void CertificateSection::close()
{
    m_store.reset();
}

QVector<Setting> CertificateSection::compare(const QJsonObject &wanted)
{
    m_wanted = wanted;
    QVector<Setting> settings = this->settings(wanted);
    int index = 0;
    for (const List &list : lists) {
        const QList<CertificateFile> files = m_store->files(list.trusted);
        const QJsonArray entries = wanted.value(list.member).toArray();
        for (const QJsonValue &entry : entries) {
            Setting &setting = settings[index++];
            setting = compared(setting, files, entry.toObject().value(fileMember).toString());
        }
    }
    return settings;
}

Reply CertificateSection::change(const Setting &setting)
{
    for (const List &list : lists) {
        const QJsonArray entries = m_wanted.value(list.member).toArray();
        for (const QJsonValue &entry : entries) {
            const QString name = entry.toObject().value(fileMember).toString();
            if (pathOf(list, name) == setting.path)
                return m_store->put(list.trusted, name, pemOf(entry));
        }
    }
    return {};
}

QJsonObject CertificateSection::exported()
{
    QJsonObject exported;
    for (const List &list : lists) {
        QJsonArray entries;
        const QList<CertificateFile> files = m_store->files(list.trusted);
        for (const CertificateFile &file : files) {
            QByteArray pem;
            const QList<QSslCertificate> certificates = file.certificates();
            for (const QSslCertificate &certificate : certificates)
                pem += certificate.toPem();
            // A file without certificates is nothing that a policy could ask for.
            if (!pem.isEmpty())
                entries.append(
                    QJsonObject{{fileMember, file.fileName()}, {pemMember, QString::fromLatin1(pem)}});
        }
        exported.insert(list.member, entries);
    }
    return exported;
}

} // namespace Agent
} // namespace Corvane
