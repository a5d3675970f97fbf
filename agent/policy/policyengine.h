// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_POLICYENGINE_H
#define CORVANE_POLICYENGINE_H

#include "policy.h"
#include "policysections.h"

#include <QtCore/QEventLoop>
#include <QtCore/QMap>
#include <QtCore/QObject>
#include <QtDBus/QDBusServiceWatcher>

#include <chrono>
#include <vector>

namespace Corvane
{
namespace Agent
{

/** Compares the phone with a policy, makes it so and keeps it there. */
class PolicyEngine : public QObject
{
    Q_OBJECT

public:
    explicit PolicyEngine(PolicySections sections);

    const PolicySections &sections() const;

    /** Tells how the phone stands to @p policy, and changes nothing. */
    QVector<Setting> check(const Policy &policy);

    /** Makes the phone so, one setting after the other, and tells what became of each. */
    QVector<Setting> apply(const Policy &policy);

    /**
     * Applies @p policy and puts right what drifts from it, until an Interruption is requested or the system
     * bus is gone. A service that leaves and comes back is taken up again. What the phone does not announce
     * is looked at every @p look.
     */
    Reply watch(const Policy &policy, std::chrono::milliseconds look);

    /** The phone's present state, and the sections that could not be asked. */
    struct Export {
        QJsonObject policy;
        QVector<Setting> missing;
    };
    Export exportPolicy();

Q_SIGNALS:
    /** During watch(): @p setting has been put right, or is not as it was last reported. */
    void reported(const Corvane::Agent::Setting &setting);

    /** During watch(): the policy has been applied; from now on drift is waited for. */
    void watching();

    void progress(const QString &path, int percent);

private:
    enum class Effort {
        Compare, ///< look
        Correct, ///< make different settings so
        Apply ///< the same, after the phone has looked outside
    };

    struct Entry {
        PolicySection *section;
        bool open = false;
        bool due = false; // to be compared again
        bool lost = false; // the service has left
    };

    QVector<Setting> processAll(const Policy &policy, Effort effort);
    QVector<Setting> process(Entry &entry, const Policy &policy, Effort effort);
    Reply open(Entry &entry, const QJsonObject &wanted);
    Setting changed(PolicySection *section, const Setting &setting);
    void follow(Entry &entry);
    void lookAgain();
    void takeUp(Entry &entry, const Policy &policy);
    void report(const Setting &setting);

    PolicySections m_sections;
    std::vector<Entry> m_entries;
    QEventLoop m_loop;
    std::vector<std::unique_ptr<QDBusServiceWatcher>> m_watchers;
    QMap<QString, QJsonObject> m_lastReports;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_POLICYENGINE_H
