// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SETTING_H
#define CORVANE_SETTING_H

#include "reply.h"

#include <QtCore/QJsonObject>
#include <QtCore/QJsonValue>
#include <QtCore/QString>
#include <QtCore/QVector>

namespace Corvane
{
namespace Agent
{

/** One setting that a policy names, and how the phone stands to it. */
struct Setting {
    enum Status {
        Compliant, ///< the phone is as the policy wants
        Different, ///< it is not, and can be made so
        Changed, ///< it has been made so
        Failed, ///< it could not be read or made so
        Unsupported ///< the phone has no way to make it so
    };

    struct Value {
        QJsonValue json;
        QString text; ///< for people; may have several lines

        static Value onOff(bool on); ///< in JSON true or false
    };

    QString path; ///< "calls.dial.default"
    Status status = Compliant;
    Value present;
    Value wanted;
    QString detail; ///< for people; why, or what is to be done
    bool serviceMissing = false; ///< unsupported only because its service does not run

    /** "compliant" and so on. */
    QString statusName() const;
    QJsonObject toJson() const;

    Setting with(Status newStatus, const QString &newDetail) const;

    /** Compliant when the present value is the wanted one, or else different. */
    Setting compared() const;

    /** What @p reply, which is not done, makes of the setting; @p whenMissing: if the service does not run.
     */
    Setting unanswered(const Reply &reply, Status whenMissing = Unsupported) const;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SETTING_H
