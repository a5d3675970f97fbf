// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CERTIFICATESECTION_H
#define CORVANE_CERTIFICATESECTION_H

#include "policysection.h"
#include "truststore.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "certificates": files of certificates that the phone must trust, and must not trust. */
class CertificateSection : public PolicySection
{
    Q_OBJECT

public:
    explicit CertificateSection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<TrustStore> m_store;
    QJsonObject m_wanted; ///< of the last comparison
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CERTIFICATESECTION_H
