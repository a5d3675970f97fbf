// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phonerecord.h"

#include "controlnames.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QRegularExpression>

#include <algorithm>

using Corvane::Simulator::ErrorSlot;
using Corvane::Simulator::GNodeInfoPointer;
using Corvane::Simulator::Variant;
namespace ControlNames = Corvane::Simulator::ControlNames;

namespace
{

constexpr int patience = 5000; // milliseconds

const QByteArray freedesktopInterfaces("org.freedesktop.DBus.");
const QByteArray introspectable("org.freedesktop.DBus.Introspectable");
const QByteArray properties("org.freedesktop.DBus.Properties");

} // namespace

QByteArray signatureOf(GDBusArgInfo *const *arguments)
{
    QByteArray signature;
    for (; arguments && *arguments; ++arguments)
        signature += (*arguments)->signature;
    return signature;
}

PhoneRecord::PhoneRecord(GDBusConnection *bus, const QByteArray &contractsFolder)
    : m_bus(bus)
{
    readContracts(contractsFolder);
    findServices();
    for (const QByteArray &service : qAsConst(m_services))
        explore(service, "/");
    for (const Offer &offer : m_offers)
        ask(offer);
    for (const auto &[name, interface] : m_interfaces) {
        const bool isOffered = std::any_of(m_offers.begin(), m_offers.end(),
                                           [&](const Offer &offer) { return offer.interface->name == name; });
        if (!isOffered && name != ControlNames::interface)
            m_unoffered.push_back(interface);
    }
}

void PhoneRecord::readContracts(const QByteArray &folder)
{
    const QFileInfoList files
        = QDir(QFile::decodeName(folder)).entryInfoList({QStringLiteral("*.xml")}, QDir::Files, QDir::Name);
    if (files.isEmpty())
        qFatal("there are no contracts in %s", folder.constData());
    for (const QFileInfo &info : files) {
        QFile file(info.filePath());
        if (!file.open(QIODevice::ReadOnly))
            qFatal("%s cannot be read", qUtf8Printable(info.filePath()));
        const QByteArray text = file.readAll();
        ErrorSlot error;
        GNodeInfoPointer node(g_dbus_node_info_new_for_xml(text.constData(), &error));
        if (!node)
            qFatal("%s: %s", qUtf8Printable(info.fileName()), error->message);
        for (GDBusInterfaceInfo **each = node->interfaces; each && *each; ++each)
            m_interfaces[(*each)->name] = *each;
        m_nodes.push_back(std::move(node));
        readWords(text);
    }
}

/** Contracts name properties, states and paths, in their comments too: quoted, or with more than small
 * letters. */
void PhoneRecord::readWords(const QByteArray &text)
{
    static const QRegularExpression word(
        QStringLiteral("(?<=\")[^\"\n]{1,60}(?=\")|[A-Za-z_./:-]*[A-Z_/][A-Za-z0-9_./:-]+"));
    auto found = word.globalMatch(QString::fromUtf8(text));
    while (found.hasNext())
        m_values.learnWord(found.next().captured().toUtf8());
}

void PhoneRecord::findServices()
{
    ErrorSlot error;
    const Variant reply = call(ControlNames::service, ControlNames::path, ControlNames::interface, "Services",
                               Variant(), &error);
    if (!reply)
        qFatal("%s (run it inside corvane-simulator)", error->message);
    const Variant services(g_variant_get_child_value(reply.get(), 0));
    for (gsize i = 0; i < g_variant_n_children(services.get()); ++i) {
        const gchar *name = nullptr;
        g_variant_get_child(services.get(), i, "(&sb)", &name, nullptr);
        m_services.append(name);
    }
}

void PhoneRecord::explore(const QByteArray &service, const QByteArray &path)
{
    ErrorSlot error;
    const Variant reply = call(service, path, introspectable, "Introspect", Variant(), &error);
    if (!reply)
        return;
    m_answers[{introspectable, "Introspect", path}] = reply;
    const gchar *xml = nullptr;
    g_variant_get(reply.get(), "(&s)", &xml);
    GNodeInfoPointer node(g_dbus_node_info_new_for_xml(xml, &error));
    if (!node)
        qFatal("%s at %s describes itself wrongly: %s", service.constData(), path.constData(),
               error->message);
    for (GDBusInterfaceInfo **each = node->interfaces; each && *each; ++each) {
        if (QByteArray((*each)->name).startsWith(freedesktopInterfaces))
            continue;
        m_interfaces.emplace((*each)->name, *each);
        m_offers.push_back({service, path, *each});
        m_values.learnWord(path);
    }
    QByteArrayList children;
    for (GDBusNodeInfo **child = node->nodes; child && *child; ++child)
        children.append((*child)->path);
    m_nodes.push_back(std::move(node));
    for (const QByteArray &child : qAsConst(children))
        explore(service, (path == "/" ? path : path + '/') + child);
}

/** Asks what needs no arguments and has an answer: it changes nothing. */
void PhoneRecord::ask(const Offer &offer)
{
    for (GDBusMethodInfo **method = offer.interface->methods; method && *method; ++method) {
        const bool isQuestion
            = signatureOf((*method)->in_args).isEmpty() && !signatureOf((*method)->out_args).isEmpty();
        if (isQuestion)
            note(offer, offer.interface->name, (*method)->name, Variant());
    }
    if (offer.interface->properties && *offer.interface->properties)
        note(offer, properties, "GetAll", Variant(g_variant_new("(s)", offer.interface->name)));
}

void PhoneRecord::note(const Offer &offer, const QByteArray &interface, const QByteArray &member,
                       const Variant &arguments)
{
    ErrorSlot error;
    const Variant reply = call(offer.service, offer.path, interface, member, arguments, &error);
    if (!reply)
        return;
    m_answers[{interface, member, offer.path}] = reply;
    m_values.learn(reply.get());
}

Variant PhoneRecord::call(const QByteArray &service, const QByteArray &path, const QByteArray &interface,
                          const QByteArray &member, const Variant &arguments, GError **error) const
{
    return Variant(g_dbus_connection_call_sync(m_bus, service.constData(), path.constData(),
                                               interface.constData(), member.constData(), arguments.get(),
                                               nullptr, G_DBUS_CALL_FLAGS_NONE, patience, nullptr, error));
}

std::optional<QByteArray> PhoneRecord::answerSignature(const QByteArray &interface,
                                                       const QByteArray &member) const
{
    if (interface == properties)
        return QByteArray(member == "Get" ? "v" : member == "GetAll" ? "a{sv}" : "");
    if (interface == introspectable)
        return QByteArray("s");
    const auto known = m_interfaces.find(interface);
    if (known == m_interfaces.end())
        return std::nullopt;
    const GDBusMethodInfo *method = g_dbus_interface_info_lookup_method(known->second, member.constData());
    return method ? std::make_optional(signatureOf(method->out_args)) : std::nullopt;
}

Variant PhoneRecord::answer(const QByteArray &path, const QByteArray &interface,
                            const QByteArray &member) const
{
    const auto known = m_answers.find({interface, member, path});
    if (known != m_answers.end())
        return known->second;
    const auto elsewhere = m_answers.lower_bound({interface, member, QByteArray()});
    const bool isTheSame = elsewhere != m_answers.end()
        && std::get<0>(elsewhere->first) == interface && std::get<1>(elsewhere->first) == member;
    return isTheSame ? elsewhere->second : Variant();
}
