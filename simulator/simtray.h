// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SIMTRAY_H
#define CORVANE_SIMULATOR_SIMTRAY_H

#include "component.h"

#include <QtCore/QJsonArray>

#include <functional>

namespace Corvane
{
namespace Simulator
{

/** The hands that put SIMs into the phone and take them out, whatever modems then see. */
class SimTray
{
public:
    /** @p changed is called with the number of a slot whose card is another, or gone. */
    SimTray(Phone &phone, std::function<void(std::size_t slot)> changed);

    /** The slot that @p text is the number of; throws Refusal. */
    std::size_t slot(const QString &text) const;
    /** The slot's card; throws Refusal when there is none. */
    Sim &card(std::size_t slot) const;
    QJsonArray describe() const;
    /** "sim pull" and "sim insert". */
    std::vector<Action> actions() const;

private:
    QString pull(const QString &slotText) const;
    QString insert(const QStringList &arguments) const;

    Phone &m_phone;
    const std::function<void(std::size_t)> m_changed;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SIMTRAY_H
