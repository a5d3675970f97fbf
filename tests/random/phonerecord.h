// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_PHONERECORD_H
#define CORVANE_TEST_PHONERECORD_H

#include "glibpointers.h"
#include "valuegenerator.h"

#include <QtCore/QByteArray>
#include <QtCore/QByteArrayList>

#include <map>
#include <optional>
#include <tuple>
#include <vector>

/** One interface of one object. */
struct Offer {
    QByteArray service;
    QByteArray path;
    GDBusInterfaceInfo *interface;
};

/** What the services of the phone offer, and what they answer when they are asked: before a stranger comes.
 */
class PhoneRecord
{
public:
    using Variant = Corvane::Simulator::Variant;

    /** Reads the contracts, then asks every service that runs. Ends the program if that is impossible. */
    PhoneRecord(GDBusConnection *bus, const QByteArray &contractsFolder);

    const QByteArrayList &services() const { return m_services; }
    const std::vector<Offer> &offers() const { return m_offers; }
    /** Those of the contracts that no object offers: the phone's state hides them, or its clients offer them.
     */
    const std::vector<GDBusInterfaceInfo *> &unoffered() const { return m_unoffered; }
    const ValueGenerator &values() const { return m_values; }

    /** The signature of what @p member of @p interface answers, if that is known. */
    std::optional<QByteArray> answerSignature(const QByteArray &interface, const QByteArray &member) const;
    /** What the phone answered, if need be from another object; null when it was not asked. */
    Variant answer(const QByteArray &path, const QByteArray &interface, const QByteArray &member) const;

private:
    void readContracts(const QByteArray &folder);
    void readWords(const QByteArray &text);
    void findServices();
    void explore(const QByteArray &service, const QByteArray &path);
    void ask(const Offer &offer);
    void note(const Offer &offer, const QByteArray &interface, const QByteArray &member,
              const Variant &arguments);
    Variant call(const QByteArray &service, const QByteArray &path, const QByteArray &interface,
                 const QByteArray &member, const Variant &arguments, GError **error) const;

    GDBusConnection *const m_bus;
    std::vector<Corvane::Simulator::GNodeInfoPointer> m_nodes; ///< own all interfaces
    std::map<QByteArray, GDBusInterfaceInfo *> m_interfaces;
    QByteArrayList m_services;
    std::vector<Offer> m_offers;
    std::vector<GDBusInterfaceInfo *> m_unoffered;
    std::map<std::tuple<QByteArray, QByteArray, QByteArray>, Variant> m_answers;
    ValueGenerator m_values;
};

/** The signature that @p arguments make. */
QByteArray signatureOf(GDBusArgInfo *const *arguments);

#endif // CORVANE_TEST_PHONERECORD_H
