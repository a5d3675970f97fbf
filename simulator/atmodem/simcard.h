// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SIMCARD_H
#define CORVANE_SIMULATOR_SIMCARD_H

#include "phone.h"

#include <QtCore/QByteArray>

#include <map>

namespace Corvane
{
namespace Simulator
{

/** An elementary file of a SIM card (3GPP 51.011). */
struct SimFile {
    enum Structure { Transparent = 0, LinearFixed = 1 };

    Structure structure = Transparent;
    bool readableWhileLocked = false; ///< also before the PIN was entered
    QList<QByteArray> records; ///< all of one length; a transparent file is a single one

    /** What the card answers to GET RESPONSE for file @p id. */
    QByteArray description(int id) const;
};

/** The files that the card @p sim has, by file number. */
std::map<int, SimFile> filesOf(const Sim &sim);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SIMCARD_H
