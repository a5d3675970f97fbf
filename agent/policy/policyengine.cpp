// SPDX-License-Identifier: LGPL-2.1-or-later
#include "policyengine.h"

#include "interruption.h"
#include "systembus.h"

#include <QtCore/QSysInfo>
#include <QtCore/QTimer>
#include <QtDBus/QDBusConnection>

#include <algorithm>
#include <utility>

namespace Corvane
{
namespace Agent
{

namespace
{

bool isInterrupted()
{
    const Interruption *interruption = Interruption::instance();
    return interruption && interruption->isRequested();
}

Reply interrupted()
{
    return {Reply::Interrupted, QStringLiteral("interrupted")};
}

QVector<Setting> unanswered(const QVector<Setting> &settings, const Reply &reply)
{
    QVector<Setting> results;
    for (const Setting &setting : settings)
        results.append(setting.unanswered(reply));
    return results;
}

} // namespace

PolicyEngine::PolicyEngine(PolicySections sections)
    : m_sections(std::move(sections))
{
    for (const auto &section : m_sections) {
        connect(section.get(), &PolicySection::progress, this, &PolicyEngine::progress);
        m_entries.push_back({section.get()});
    }
}

const PolicySections &PolicyEngine::sections() const
{
    return m_sections;
}

QVector<Setting> PolicyEngine::check(const Policy &policy)
{
    return processAll(policy, Effort::Compare);
}

QVector<Setting> PolicyEngine::apply(const Policy &policy)
{
    return processAll(policy, Effort::Apply);
}

QVector<Setting> PolicyEngine::processAll(const Policy &policy, Effort effort)
{
    QVector<Setting> settings;
    for (Entry &entry : m_entries)
        settings += process(entry, policy, effort);
    return settings;
}

QVector<Setting> PolicyEngine::process(Entry &entry, const Policy &policy, Effort effort)
{
    PolicySection *section = entry.section;
    const QJsonObject wanted = policy.settingsOf(*section);
    const QVector<Setting> named = section->settings(wanted);
    if (named.isEmpty())
        return {};
    if (isInterrupted())
        return unanswered(named, interrupted());
    const Reply opened = open(entry, wanted);
    if (!opened.isDone())
        return unanswered(named, opened);
    if (effort == Effort::Apply) {
        const Reply refreshed = section->refresh();
        if (!refreshed.isDone())
            return unanswered(named, refreshed);
    }
    QVector<Setting> settings = section->compare(wanted);
    if (effort == Effort::Compare)
        return settings;
    for (Setting &setting : settings) {
        if (setting.status == Setting::Different)
            setting = changed(section, setting);
    }
    return settings;
}

Reply PolicyEngine::open(Entry &entry, const QJsonObject &wanted)
{
    if (entry.open)
        return {};
    Reply reply = entry.section->service().ensureRunning();
    if (reply.isDone())
        reply = entry.section->open(wanted);
    entry.open = reply.isDone();
    if (!entry.open)
        entry.section->close();
    return reply;
}

Setting PolicyEngine::changed(PolicySection *section, const Setting &setting)
{
    const Reply reply = isInterrupted() ? interrupted() : section->change(setting);
    if (reply.isDone())
        return setting.with(Setting::Changed, setting.detail);
    return setting.unanswered(reply, Setting::Failed);
}

Reply PolicyEngine::watch(const Policy &policy, std::chrono::milliseconds look)
{
    Reply end = SystemBus::reach();
    const SystemBus bus;
    connect(&bus, &SystemBus::lost, this, [&](const Reply &reply) {
        end = reply;
        m_loop.quit();
    });
    if (Interruption *interruption = Interruption::instance())
        connect(interruption, &Interruption::requested, &m_loop, &QEventLoop::quit);
    for (Entry &entry : m_entries) {
        if (!policy.settingsOf(*entry.section).isEmpty())
            follow(entry);
    }
    // Not while something else is under way.
    bool isLookDue = false;
    QTimer timer;
    connect(&timer, &QTimer::timeout, this, [&] {
        isLookDue = true;
        m_loop.quit();
    });
    timer.start(look);
    const auto isOver = [&] {
        return isInterrupted() || !end.isDone();
    };
    const auto isDue = [](const Entry &entry) {
        return entry.due;
    };
    for (bool applied = false; !isOver(); applied = true) {
        if (std::exchange(isLookDue, false))
            lookAgain();
        for (Entry &entry : m_entries) {
            if (entry.due)
                takeUp(entry, policy);
        }
        if (!applied)
            Q_EMIT watching();
        if (!isOver() && !isLookDue && std::none_of(m_entries.cbegin(), m_entries.cend(), isDue))
            m_loop.exec();
    }
    return end.isDone() ? interrupted() : end;
}

void PolicyEngine::follow(Entry &entry)
{
    const auto wake = [this, &entry] {
        entry.due = true;
        m_loop.quit();
    };
    const QString service = entry.section->service().name;
    if (!service.isEmpty()) {
        auto watcher = std::make_unique<QDBusServiceWatcher>(service, QDBusConnection::systemBus());
        connect(watcher.get(), &QDBusServiceWatcher::serviceRegistered, this, wake);
        connect(watcher.get(), &QDBusServiceWatcher::serviceUnregistered, this, [&entry, wake] {
            entry.lost = true;
            wake();
        });
        m_watchers.push_back(std::move(watcher));
    }
    connect(entry.section, &PolicySection::drifted, this, wake);
    entry.due = true;
}

void PolicyEngine::lookAgain()
{
    for (Entry &entry : m_entries) {
        if (entry.open && !entry.due)
            entry.due = entry.section->mayHaveDrifted();
    }
}

void PolicyEngine::takeUp(Entry &entry, const Policy &policy)
{
    entry.due = false;
    if (entry.lost) {
        entry.lost = false;
        entry.open = false;
        entry.section->close();
    }
    const QVector<Setting> settings = process(entry, policy, entry.open ? Effort::Correct : Effort::Apply);
    if (!isInterrupted())
        std::for_each(settings.cbegin(), settings.cend(),
                      [this](const Setting &setting) { report(setting); });
}

void PolicyEngine::report(const Setting &setting)
{
    // What has been changed is compliant from now on, so that looking again brings no news.
    const Setting lasting
        = setting.status == Setting::Changed ? setting.with(Setting::Compliant, {}) : setting;
    const QJsonObject news{{QStringLiteral("status"), lasting.statusName()},
                           {QStringLiteral("detail"), lasting.detail}};
    if (setting.status == Setting::Changed || m_lastReports.value(setting.path) != news)
        Q_EMIT reported(setting);
    m_lastReports.insert(setting.path, news);
}

PolicyEngine::Export PolicyEngine::exportPolicy()
{
    Export result;
    result.policy.insert(QStringLiteral("name"),
                         QStringLiteral("Exported from %1").arg(QSysInfo::machineHostName()));
    for (Entry &entry : m_entries) {
        const Reply opened = open(entry, {});
        if (!opened.isDone()) {
            Setting section;
            section.path = entry.section->member();
            result.missing.append(section.unanswered(opened));
            continue;
        }
        const QJsonObject exported = entry.section->exported();
        if (!exported.isEmpty())
            result.policy.insert(entry.section->member(), exported);
    }
    return result;
}

} // namespace Agent
} // namespace Corvane
