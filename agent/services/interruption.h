// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_INTERRUPTION_H
#define CORVANE_INTERRUPTION_H

#include <QtCore/QObject>

namespace Corvane
{
namespace Agent
{

/**
 * SIGINT, SIGTERM and SIGHUP as a Qt signal, so that objects which are registered with a service are
 * destroyed.
 *
 * A second SIGINT ends the program at once, should it hang in a blocking call. At most one object exists;
 * make it before anything starts threads.
 */
class Interruption : public QObject
{
    Q_OBJECT

public:
    Interruption();
    ~Interruption() override;

    /** The object, or null. */
    static Interruption *instance();

    /** Waits until @p descriptor can be read. @return false when an interruption has been requested. */
    static bool waitForInput(int descriptor);

    bool isRequested() const;

Q_SIGNALS:
    void requested();

private:
    void readSignal();

    bool m_requested = false;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_INTERRUPTION_H
