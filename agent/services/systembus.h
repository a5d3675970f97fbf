// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SYSTEMBUS_H
#define CORVANE_SYSTEMBUS_H

#include "reply.h"

#include <QtCore/QObject>

namespace Corvane
{
namespace Agent
{

/** The bus itself, which goes away without telling that the services on it did. */
class SystemBus : public QObject
{
    Q_OBJECT

public:
    explicit SystemBus(QObject *parent = nullptr);

    /** Whether the bus can be reached, or why not. */
    static Reply reach();

Q_SIGNALS:
    void lost(const Corvane::Agent::Reply &reply);

private Q_SLOTS:
    void tellLost();
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SYSTEMBUS_H
