// SPDX-License-Identifier: LGPL-2.1-or-later
#include "modemmanager.h"

#include "ofono.h"
#include "service.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String rootPath("/");
const QLatin1String interfaceName("org.veldmobile.ofono.ModemManager");
constexpr gint32 contractVersion = 1;

GVariant *fromPaths(const QStringList &paths)
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE_OBJECT_PATH_ARRAY);
    for (const QString &path : paths)
        g_variant_builder_add(&list, "o", path.toUtf8().constData());
    return g_variant_new("(@ao)", g_variant_builder_end(&list));
}

GVariant *fromFlags(const std::vector<bool> &flags)
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("ab"));
    for (const bool flag : flags)
        g_variant_builder_add(&list, "b", gboolean(flag));
    return g_variant_new("(@ab)", g_variant_builder_end(&list));
}

GVariant *fromString(const QString &text)
{
    return g_variant_new("(s)", text.toUtf8().constData());
}

GVariant *fromFlag(bool flag)
{
    return g_variant_new("(b)", gboolean(flag));
}

} // namespace

ModemManager::ModemManager(const ModemList &modems, const QJsonObject &profile, std::function<void()> changed)
    : m_modems(modems)
    , m_changed(std::move(changed))
    , m_isOffered(profile.value(QLatin1String("extensions")).toBool(true))
{
    const auto imsiOf = [&](const char *member) {
        const int slot = profile.value(QLatin1String(member)).toInt(-1);
        return slot < 0 ? QString() : m_modems.at(std::size_t(slot))->sim().imsi;
    };
    m_voiceSim = imsiOf("voiceSim");
    m_dataSim = imsiOf("dataSim");
}

void ModemManager::attach(Service &service)
{
    m_service = &service;
    m_isOnBus = false;
    setOnBus();
}

void ModemManager::setOnBus()
{
    if (m_isOffered == m_isOnBus)
        return;
    m_isOnBus = m_isOffered;
    m_told = state();
    if (!m_isOffered) {
        m_service->removeObject(rootPath, interfaceName);
        return;
    }

    const auto answer = [this](auto value) -> MethodHandler {
        return [this, value](MethodCall &call) {
            call.reply(value(state()));
        };
    };
    m_service->addObject(
        rootPath, interfaceName,
        {
            {QStringLiteral("GetInterfaceVersion"),
             answer([](const State &) { return g_variant_new("(i)", contractVersion); })},
            {QStringLiteral("GetAvailableModems"),
             answer([](const State &now) { return fromPaths(now.available); })},
            {QStringLiteral("GetEnabledModems"),
             answer([](const State &now) { return fromPaths(now.enabled); })},
            {QStringLiteral("GetPresentSims"),
             answer([](const State &now) { return fromFlags(now.present); })},
            {QStringLiteral("GetIMEI"), answer([this](const State &now) {
                 QStringList imeis;
                 for (const QString &path : now.available)
                     imeis << modemAt(path)->imei();
                 return g_variant_new("(@as)", fromList(imeis).get());
             })},
            {QStringLiteral("GetDefaultVoiceSim"),
             answer([](const State &now) { return fromString(now.voiceSim); })},
            {QStringLiteral("GetDefaultDataSim"),
             answer([](const State &now) { return fromString(now.dataSim); })},
            {QStringLiteral("GetReady"), answer([](const State &now) { return fromFlag(now.ready); })},
            {QStringLiteral("SetEnabledModems"),
             [this](MethodCall &call) {
                 setEnabledModems(call);
             }},
            {QStringLiteral("SetDefaultVoiceSim"),
             [this](MethodCall &call) {
                 setDefaultSim(call, &ModemManager::m_voiceSim);
             }},
            {QStringLiteral("SetDefaultDataSim"),
             [this](MethodCall &call) {
                 setDefaultSim(call, &ModemManager::m_dataSim);
             }},
        });
}

ModemManager::State ModemManager::state() const
{
    State now;
    for (const std::unique_ptr<Modem> &modem : m_modems) {
        if (!modem->isThere())
            continue;
        now.available << modem->path();
        if (modem->isEnabled())
            now.enabled << modem->path();
        now.present.push_back(modem->sim().present);
    }
    now.voiceSim = effectiveSim(m_voiceSim);
    now.dataSim = effectiveSim(m_dataSim);
    now.ready = m_isReady;
    return now;
}

QString ModemManager::effectiveSim(const QString &chosen) const
{
    QString first;
    for (const std::unique_ptr<Modem> &modem : m_modems) {
        if (!modem->isThere() || !modem->isEnabled() || !modem->sim().isUsable())
            continue;
        if (modem->sim().imsi == chosen)
            return chosen;
        if (first.isEmpty())
            first = modem->sim().imsi;
    }
    return first;
}

Modem *ModemManager::modemAt(const QString &path) const
{
    const auto found = std::find_if(m_modems.begin(), m_modems.end(), [&](const auto &modem) {
        return modem->isThere() && modem->path() == path;
    });
    return found == m_modems.end() ? nullptr : found->get();
}

void ModemManager::setEnabledModems(MethodCall &call)
{
    QStringList wanted;
    const Variant list(g_variant_get_child_value(call.arguments(), 0));
    GVariantIter iterator;
    g_variant_iter_init(&iterator, list.get());
    const gchar *text = nullptr;
    while (g_variant_iter_next(&iterator, "&o", &text)) {
        const QString path = QString::fromUtf8(text);
        if (!modemAt(path))
            throw Ofono::invalidArguments(QStringLiteral("There is no modem %1").arg(path));
        wanted << path;
    }
    call.reply();
    for (const std::unique_ptr<Modem> &modem : m_modems) {
        if (modem->isThere())
            modem->setEnabled(wanted.contains(modem->path()));
    }
    m_changed();
}

void ModemManager::setDefaultSim(MethodCall &call, QString ModemManager::*choice)
{
    const QString imsi = call.text(0);
    const bool isKnown = std::any_of(m_modems.begin(), m_modems.end(), [&](const auto &modem) {
        return modem->sim().isUsable() && modem->sim().imsi == imsi;
    });
    if (!imsi.isEmpty() && !isKnown)
        throw Ofono::invalidArguments(QStringLiteral("There is no SIM %1 in the phone").arg(imsi));
    call.reply();
    this->*choice = imsi;
    m_changed();
}

void ModemManager::emitSignal(const char *member, GVariant *arguments) const
{
    m_service->emitSignal(rootPath, interfaceName, QLatin1String(member), arguments);
}

void ModemManager::announce()
{
    if (!m_service)
        return;
    setOnBus();
    if (!m_isOnBus)
        return;
    const State now = state();
    if (now.available != m_told.available) {
        emitSignal("AvailableModemsChanged", fromPaths(now.available));
    } else {
        for (std::size_t index = 0; index < now.present.size(); ++index) {
            if (now.present[index] != m_told.present[index])
                emitSignal("PresentSimsChanged",
                           g_variant_new("(ib)", gint32(index), gboolean(now.present[index])));
        }
    }
    m_told.available = now.available;
    m_told.present = now.present;
    if (now.enabled != m_told.enabled)
        emitSignal("EnabledModemsChanged", fromPaths(now.enabled));
    m_told.enabled = now.enabled;
}

void ModemManager::announceDefaults()
{
    if (!m_service || !m_isOnBus)
        return;
    const State now = state();
    if (now.voiceSim != m_told.voiceSim)
        emitSignal("DefaultVoiceSimChanged", fromString(now.voiceSim));
    if (now.dataSim != m_told.dataSim)
        emitSignal("DefaultDataSimChanged", fromString(now.dataSim));
    if (now.ready != m_told.ready)
        emitSignal("ReadyChanged", fromFlag(now.ready));
    m_told = now;
}

QJsonObject ModemManager::describe() const
{
    const State now = state();
    return {{QStringLiteral("extensions"), m_isOffered},
            {QStringLiteral("ready"), now.ready},
            {QStringLiteral("voiceSim"), now.voiceSim},
            {QStringLiteral("dataSim"), now.dataSim}};
}

} // namespace Simulator
} // namespace Corvane
