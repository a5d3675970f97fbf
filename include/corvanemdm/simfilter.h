// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMFILTER_H
#define CORVANEMDM_SIMFILTER_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDebug>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

/**
 * @brief The vocabulary of the SIM filters: what happens to traffic while a given SIM is in use.
 *
 * SimVoiceCallFilter and its siblings for messages and data speak in these types. No service answers here.
 */
class CORVANEMDM_EXPORT SimFilter : public QObject
{
    Q_OBJECT

public:
    /** What happens to the traffic. Any other number is not an action; it is refused, or read as Block. */
    enum Action : uint {
        Block = 1, ///< the traffic is refused
        Ignore = 1, ///< another name of Block
        Allow = 2, ///< the traffic is let through
        Hangup = 3 ///< the call is hung up; for incoming calls only
    };
    Q_ENUM(Action)

    /** @brief One SIM and what happens to its traffic. The IMSI is the key of a rule list. */
    class CORVANEMDM_EXPORT Rule
    {
    public:
        /** A rule without an IMSI that blocks. */
        Rule();
        /** A rule for the SIM @p simImsi; see isValidImsi() for what the filters accept. */
        Rule(const QString &simImsi, Action simAction);

        /** Whether IMSI and action are the same. */
        bool operator==(const Rule &other) const;
        /** Whether IMSI or action differ. */
        bool operator!=(const Rule &other) const;

        /** "Rule (imsi=244, action=2)": the action as its number. */
        operator QString() const;

        QString imsi; ///< decimal subscriber identity of the SIM
        Action action; ///< what happens to its traffic
    };

    /** Rules in the order in which the service keeps them. */
    typedef QList<SimFilter::Rule> RuleList;

    /** Only the static members do anything. */
    explicit SimFilter(QObject *parent = nullptr);
    ~SimFilter() override;

    /** Whether @p imsi is made of at most 15 decimal digits. The empty string is valid. */
    static bool isValidImsi(const QString &imsi);
};

/** Writes "block", "allow" or "hangup", and nothing for any other number. */
CORVANEMDM_EXPORT QDebug operator<<(QDebug debug, const SimFilter::Action &action);

/** Writes the rule with its action in words, or "Rule (this = 0x0)" for a null pointer. */
CORVANEMDM_EXPORT QDebug operator<<(QDebug debug, const SimFilter::Rule *rule);

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::SimFilter::Rule)
Q_DECLARE_METATYPE(Corvane::Mdm::SimFilter::RuleList)

#endif // CORVANEMDM_SIMFILTER_H
