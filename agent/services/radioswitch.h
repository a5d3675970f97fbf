// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_RADIOSWITCH_H
#define CORVANE_RADIOSWITCH_H

#include "answer.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtCore/QObject>

#include <chrono>

namespace Corvane
{
namespace Agent
{

/** What the connection manager switches for the whole phone. */
enum class Radio { WiFi, FlightMode };

/** "Wi-Fi" and so on. */
QString radioName(Radio radio);

/** One of the phone's switches. What it is asked for blocks, and is awaited until the phone confirms it. */
class RadioSwitch : public QObject
{
    Q_OBJECT

public:
    RadioSwitch(Radio radio, std::chrono::milliseconds timeout, QObject *parent = nullptr);

    Answer<bool> isOn() const;
    /** What is so already is done without asking. */
    Reply set(bool on);

Q_SIGNALS:
    void changed();

private:
    Radio m_radio;
    std::chrono::milliseconds m_timeout;
    Mdm::ConnectivitySettings m_settings;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_RADIOSWITCH_H
