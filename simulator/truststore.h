// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_TRUSTSTORE_H
#define CORVANE_SIMULATOR_TRUSTSTORE_H

#include <QtCore/QByteArray>
#include <QtCore/QByteArrayList>
#include <QtCore/QLatin1String>

namespace Corvane
{
namespace Simulator
{

/** The files that say whom the phone trusts. The phone is made with them, its certificate helper changes
 * them.
 */
namespace TrustStore
{

const QLatin1String folder("/etc/pki/ca-trust");
const QLatin1String anchorsFolder("/etc/pki/ca-trust/source/anchors");
const QLatin1String blacklistFolder("/etc/pki/ca-trust/source/blacklist");
const QLatin1String extractedFolder("/etc/pki/ca-trust/extracted/pem");
/** What programs read: made of all the others. */
const QLatin1String extractedBundle("/etc/pki/ca-trust/extracted/pem/tls-ca-bundle.pem");
/** The authorities that come with the system. */
const QLatin1String systemBundle("/usr/share/pki/ca-trust-source/ca-bundle.pem");

/** The certificates in the text @p pem, each with its delimiters and nothing around them. */
QByteArrayList certificatesIn(const QByteArray &pem);

/** @p trusted without what is in @p distrusted, and each certificate once. */
QByteArray extracted(const QByteArrayList &trusted, const QByteArrayList &distrusted);

} // namespace TrustStore
} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_TRUSTSTORE_H
