// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_COMPONENT_H
#define CORVANE_SIMULATOR_COMPONENT_H

#include "phone.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;
struct PhoneFiles;

/** Something that can be done to the phone from outside, as a person or the world would. */
struct Action {
    QString name; ///< words, such as "sim pull"
    QString usage; ///< of the arguments, such as "SLOT [IMSI]"
    QString description;
    int minimumArguments;
    int maximumArguments;
    /** Returns a text for people, or an empty one; throws Refusal. */
    std::function<QString(const QStringList &arguments)> perform;
};

/**
 * A part of the phone that offers objects over a service's name.
 *
 * It lives as long as the phone. What the phone stores is kept in its members and survives a stop of the
 * service; what a daemon keeps in memory is dropped in detach().
 */
class Component
{
public:
    virtual ~Component() = default;

    /** The service starts: offer the objects on it. */
    virtual void attach(Service &service) = 0;
    /** The service stops: forget it, its clients and what was under way. */
    virtual void detach() = 0;
    /** Adds its members to the state of the phone. */
    virtual void describe(QJsonObject &state) const = 0;
    virtual std::vector<Action> actions() { return {}; }
};

/** How a component comes into the phone. Each has one object of this, at namespace scope in its own file. */
struct ComponentType {
    /** The bus name that the component's objects are offered over. */
    QString service;
    std::function<std::unique_ptr<Component>(const QJsonObject &profile, Phone &phone)> create;
    /**
     * Looks for what the profile's schema cannot say: the JSON path at fault, a colon and what would be
     * right; empty when all is well.
     */
    std::function<QString(const QJsonObject &profile)> problemOf;
    /** Adds what the phone has at fixed paths for it; empty when that is nothing. */
    std::function<void(const QJsonObject &profile, PhoneFiles &files)> addFiles = {};
};

class ComponentRegistration
{
public:
    explicit ComponentRegistration(ComponentType type);
    /** All that are registered, ordered by service. */
    static const std::vector<ComponentType> &all();
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_COMPONENT_H
