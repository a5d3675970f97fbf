// SPDX-License-Identifier: LGPL-2.1-or-later
#include <timed/triggers.h>

#include <QtCore/QMetaType>
#include <QtDBus/QDBusMetaType>

namespace
{

// Runs when the library is loaded: the time daemon's messages may be handled before any feature object
// exists.
void registerTypesAtLoad()
{
    qRegisterMetaType<Maemo::Timed::Event::Triggers>("Maemo::Timed::Event::Triggers");
    qDBusRegisterMetaType<Maemo::Timed::Event::Triggers>();
}

} // namespace

Q_CONSTRUCTOR_FUNCTION(registerTypesAtLoad)
