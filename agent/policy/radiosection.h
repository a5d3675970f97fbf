// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_RADIOSECTION_H
#define CORVANE_RADIOSECTION_H

#include "policysection.h"
#include "radioswitch.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "wifi" or "flightMode": whether it is on. */
class RadioSection : public PolicySection
{
    Q_OBJECT

public:
    RadioSection(Radio radio, std::chrono::milliseconds timeout);

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
    const Radio m_radio;
    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<RadioSwitch> m_switch;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_RADIOSECTION_H
