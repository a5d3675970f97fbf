// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PROPERTIES_H
#define CORVANE_SIMULATOR_PROPERTIES_H

#include "glibpointers.h"

#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <utility>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

/** The properties of an object in the telephony daemon's way, in the order in which changes are announced. */
using Properties = std::vector<std::pair<QString, Variant>>;

Variant fromText(const QString &text);
Variant fromBool(bool value);
Variant fromByte(quint8 value);
Variant fromList(const QStringList &list);
/** "a{sv}" */
GVariant *toVariant(const Properties &properties);

/** What has been told of the properties of one interface. */
class PropertyChanges
{
public:
    /** Takes @p now for told. */
    void reset(const Properties &now) { m_told = now; }
    /** Calls @p announce for each property that is new or has changed; what is missing from @p now goes
     * unsaid. */
    void take(const Properties &now,
              const std::function<void(const QString &name, GVariant *value)> &announce);

private:
    Properties m_told;
};

/** Announces what has changed of an object's properties in D-Bus's own way, if anything has. */
void announceChanges(const Service &service, const QString &path, const QString &interface,
                     PropertyChanges *told, const Properties &now);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PROPERTIES_H
