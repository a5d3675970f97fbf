// SPDX-License-Identifier: LGPL-2.1-or-later
#include "truststore.h"

#include <QtCore/QSet>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QByteArray begin("-----BEGIN CERTIFICATE-----");
const QByteArray end("-----END CERTIFICATE-----");

/** What makes a certificate the same one, however its lines are broken. */
QByteArray identityOf(const QByteArray &certificate)
{
    return QByteArray::fromBase64(
        certificate.mid(begin.size(), certificate.size() - begin.size() - end.size()));
}

} // namespace

QByteArrayList TrustStore::certificatesIn(const QByteArray &pem)
{
    QByteArrayList certificates;
    int from = pem.indexOf(begin);
    while (from >= 0) {
        const int to = pem.indexOf(end, from);
        if (to < 0)
            break;
        certificates << pem.mid(from, to + end.size() - from);
        from = pem.indexOf(begin, to);
    }
    return certificates;
}

QByteArray TrustStore::extracted(const QByteArrayList &trusted, const QByteArrayList &distrusted)
{
    QSet<QByteArray> seen;
    for (const QByteArray &certificate : distrusted)
        seen.insert(identityOf(certificate));
    QByteArray bundle;
    for (const QByteArray &certificate : trusted) {
        const QByteArray identity = identityOf(certificate);
        if (seen.contains(identity))
            continue;
        seen.insert(identity);
        bundle += certificate + '\n';
    }
    return bundle;
}

} // namespace Simulator
} // namespace Corvane
