// SPDX-License-Identifier: LGPL-2.1-or-later
#include "control.h"

#include "controlnames.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QJsonDocument>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName(ControlNames::service);
const QLatin1String objectPath(ControlNames::path);
const QLatin1String interfaceName(ControlNames::interface);

GVariant *stringTuple(const QString &text)
{
    return g_variant_new("(s)", text.toUtf8().constData());
}

PhoneService::Done answerWhenDone(const MethodCall &call)
{
    return [call](const QString &problem) {
        MethodCall waiting = call;
        if (problem.isEmpty())
            waiting.reply();
        else
            waiting.fail(Refusal(problem));
    };
}

} // namespace

Control::Control(std::vector<std::unique_ptr<PhoneService>> &services, Journal &journal, FaultTable &faults,
                 const QJsonObject &identity)
    : m_services(services)
    , m_journal(journal)
    , m_faults(faults)
    , m_identity(identity)
{
    m_connection.addObject(
        objectPath, interfaceName,
        {
            {QStringLiteral("Services"),
             [this](MethodCall &call) {
                 call.reply(describeServices());
             }},
            {QStringLiteral("StopService"),
             [this](MethodCall &call) {
                 service(call.text(0)).stop(answerWhenDone(call));
             }},
            {QStringLiteral("StartService"),
             [this](MethodCall &call) {
                 PhoneService &stopped = service(call.text(0));
                 if (stopped.isRunning())
                     call.reply();
                 else
                     stopped.start(answerWhenDone(call));
             }},
            {QStringLiteral("SetFault"),
             [this](MethodCall &call) {
                 const QString name = simulatedService(call.text(0)).name();
                 const Variant options(g_variant_get_child_value(call.arguments(), 5));
                 const quint32 id = m_faults.add(name, call.text(1), call.text(2), call.text(3), call.text(4),
                                                 options.get());
                 call.reply(g_variant_new("(u)", id));
             }},
            {QStringLiteral("ClearFault"),
             [this](MethodCall &call) {
                 const guint32 id = call.number(0);
                 if (!m_faults.remove(id))
                     throw Refusal(
                         QStringLiteral(
                             "There is no fault %1; \"corvane-simctl faults\" lists those that are set")
                             .arg(id));
                 call.reply();
             }},
            {QStringLiteral("ClearFaults"),
             [this](MethodCall &call) {
                 m_faults.clear();
                 call.reply();
             }},
            {QStringLiteral("Faults"),
             [this](MethodCall &call) {
                 call.reply(g_variant_new("(@a(usssssa{sv}))", m_faults.describe()));
             }},
            {QStringLiteral("EmitSignal"),
             [this](MethodCall &call) {
                 emitServiceSignal(call);
                 call.reply();
             }},
            {QStringLiteral("Journal"),
             [this](MethodCall &call) {
                 guint64 after = 0;
                 g_variant_get(call.arguments(), "(t)", &after);
                 call.reply(g_variant_new("(@a(ttsssssss))", m_journal.entriesAfter(after)));
             }},
            {QStringLiteral("ClearJournal"),
             [this](MethodCall &call) {
                 m_journal.clear();
                 call.reply();
             }},
            {QStringLiteral("Actions"),
             [this](MethodCall &call) {
                 call.reply(describeActions());
             }},
            {QStringLiteral("Act"),
             [this](MethodCall &call) {
                 const gchar *name = nullptr;
                 const gchar **arguments = nullptr;
                 g_variant_get(call.arguments(), "(&s^a&s)", &name, &arguments);
                 QStringList list;
                 for (const gchar **argument = arguments; *argument; ++argument)
                     list << QString::fromUtf8(*argument);
                 g_free(arguments);
                 call.reply(stringTuple(act(QString::fromUtf8(name), list)));
             }},
            {QStringLiteral("State"),
             [this](MethodCall &call) {
                 call.reply(stringTuple(state()));
             }},
        });

    m_journal.setAnnouncer([this](GVariant *entry) {
        m_connection.emitSignal(objectPath, interfaceName, QStringLiteral("CallReceived"),
                                g_variant_new("(@(ttsssssss))", entry));
    });
    m_connection.ownName(serviceName);
}

PhoneService &Control::service(const QString &name) const
{
    QStringList known;
    for (const std::unique_ptr<PhoneService> &each : m_services) {
        if (each->name() == name)
            return *each;
        known << each->name();
    }
    throw Refusal(QStringLiteral("There is no service \"%1\"; there are %2")
                      .arg(name, known.join(QStringLiteral(", "))));
}

Service &Control::simulatedService(const QString &name) const
{
    if (Service *simulated = service(name).simulated())
        return *simulated;
    throw Refusal(
        QStringLiteral("%1 is a real daemon's: it can only be stopped, started and acted upon").arg(name));
}

GVariant *Control::describeServices() const
{
    GVariantBuilder services;
    g_variant_builder_init(&services, G_VARIANT_TYPE("a(sb)"));
    for (const std::unique_ptr<PhoneService> &each : m_services)
        g_variant_builder_add(&services, "(sb)", each->name().toUtf8().constData(),
                              gboolean(each->isRunning()));
    return g_variant_new("(a(sb))", &services);
}

void Control::emitServiceSignal(MethodCall &call) const
{
    const Service &emitter = simulatedService(call.text(0));
    const QString path = call.text(1);
    const QString interface = call.text(2);
    const QString member = call.text(3);
    if (!emitter.isRunning())
        throw Refusal(
            QStringLiteral("%1 is stopped; start it before it can emit a signal").arg(emitter.name()));
    if (!g_variant_is_object_path(path.toUtf8().constData()))
        throw Refusal(QStringLiteral("\"%1\" is no object path; one is /mdm/voicecallfilter/dial").arg(path));
    if (!g_dbus_is_interface_name(interface.toUtf8().constData()))
        throw Refusal(QStringLiteral("\"%1\" is no interface name; one is org.ofono.Modem").arg(interface));
    if (!g_dbus_is_member_name(member.toUtf8().constData()))
        throw Refusal(QStringLiteral("\"%1\" is no signal name; one is PropertyChanged").arg(member));

    const Variant boxes(g_variant_get_child_value(call.arguments(), 4));
    GVariantBuilder arguments;
    g_variant_builder_init(&arguments, G_VARIANT_TYPE_TUPLE);
    for (gsize i = 0; i < g_variant_n_children(boxes.get()); ++i) {
        const Variant box(g_variant_get_child_value(boxes.get(), i));
        g_variant_builder_add_value(&arguments, Variant(g_variant_get_variant(box.get())).get());
    }
    emitter.emitSignal(path, interface, member, g_variant_builder_end(&arguments));
}

GVariant *Control::describeActions() const
{
    GVariantBuilder actions;
    g_variant_builder_init(&actions, G_VARIANT_TYPE("a(sss)"));
    for (const std::unique_ptr<PhoneService> &each : m_services) {
        for (const std::unique_ptr<Component> &component : each->components()) {
            for (const Action &action : component->actions()) {
                g_variant_builder_add(&actions, "(sss)", action.name.toUtf8().constData(),
                                      action.usage.toUtf8().constData(),
                                      action.description.toUtf8().constData());
            }
        }
    }
    return g_variant_new("(a(sss))", &actions);
}

QString Control::act(const QString &name, const QStringList &arguments) const
{
    QStringList known;
    for (const std::unique_ptr<PhoneService> &each : m_services) {
        for (const std::unique_ptr<Component> &component : each->components()) {
            for (const Action &action : component->actions()) {
                known << action.name;
                if (action.name != name)
                    continue;
                if (arguments.size() < action.minimumArguments
                    || arguments.size() > action.maximumArguments) {
                    throw Refusal(QStringLiteral("\"%1\" takes %2; it was given %3 %4")
                                      .arg(name, action.usage, QString::number(arguments.size()),
                                           arguments.size() == 1 ? QStringLiteral("argument")
                                                                 : QStringLiteral("arguments")));
                }
                return action.perform(arguments);
            }
        }
    }
    throw Refusal(QStringLiteral("There is no action \"%1\"; there are %2")
                      .arg(name, known.join(QStringLiteral(", "))));
}

QString Control::state() const
{
    QJsonObject state = m_identity;
    for (const std::unique_ptr<PhoneService> &each : m_services) {
        for (const std::unique_ptr<Component> &component : each->components())
            component->describe(state);
    }
    return QString::fromUtf8(QJsonDocument(state).toJson(QJsonDocument::Compact));
}

} // namespace Simulator
} // namespace Corvane
