// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_WIRERULE_H
#define CORVANE_TEST_WIRERULE_H

#include <QtCore/QList>
#include <QtCore/QString>
#include <QtDBus/QDBusArgument>

/** A rule as the service sends it: any number may stand for the action. */
struct WireRule {
    QString imsi;
    quint32 action = 0;
};
Q_DECLARE_METATYPE(WireRule)
using WireRules = QList<WireRule>;
Q_DECLARE_METATYPE(WireRules)

QDBusArgument &operator<<(QDBusArgument &out, const WireRule &rule);
const QDBusArgument &operator>>(const QDBusArgument &in, WireRule &rule);

#endif // CORVANE_TEST_WIRERULE_H
