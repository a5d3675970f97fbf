// SPDX-License-Identifier: LGPL-2.1-or-later
#include "interruption.h"

#include <QtCore/QEventLoop>
#include <QtCore/QSocketNotifier>

#include <csignal>
#include <fcntl.h>
#include <unistd.h>

namespace Corvane
{
namespace Agent
{

namespace
{

constexpr int handledSignals[] = {SIGINT, SIGTERM, SIGHUP};

Interruption *theInstance = nullptr;
int signalPipe[2] = {-1, -1};

extern "C" void passOn(int)
{
    // A full pipe already holds what is to be told.
    const char byte = 1;
    [[maybe_unused]] const ssize_t written = ::write(signalPipe[1], &byte, 1);
}

void handleWith(void (*handler)(int))
{
    struct sigaction action = {};
    action.sa_handler = handler;
    action.sa_flags = SA_RESTART | int(SA_RESETHAND);
    for (const int signal : handledSignals)
        ::sigaction(signal, &action, nullptr);
}

} // namespace

Interruption::Interruption()
{
    Q_ASSERT(!theInstance);
    theInstance = this;
    if (::pipe2(signalPipe, O_CLOEXEC | O_NONBLOCK) != 0)
        qFatal("cannot make a pipe");
    auto *notifier = new QSocketNotifier(signalPipe[0], QSocketNotifier::Read, this);
    connect(notifier, &QSocketNotifier::activated, this, &Interruption::readSignal);
    handleWith(passOn);
}

Interruption::~Interruption()
{
    handleWith(SIG_DFL);
    ::close(signalPipe[0]);
    ::close(signalPipe[1]);
    theInstance = nullptr;
}

Interruption *Interruption::instance()
{
    return theInstance;
}

bool Interruption::waitForInput(int descriptor)
{
    QEventLoop loop;
    const QSocketNotifier notifier(descriptor, QSocketNotifier::Read);
    QObject::connect(&notifier, &QSocketNotifier::activated, &loop, &QEventLoop::quit);
    if (theInstance)
        QObject::connect(theInstance, &Interruption::requested, &loop, &QEventLoop::quit);
    if (!theInstance || !theInstance->isRequested())
        loop.exec();
    return !theInstance || !theInstance->isRequested();
}

bool Interruption::isRequested() const
{
    return m_requested;
}

void Interruption::readSignal()
{
    char bytes[16];
    [[maybe_unused]] const ssize_t count = ::read(signalPipe[0], bytes, sizeof bytes);
    m_requested = true;
    Q_EMIT requested();
}

} // namespace Agent
} // namespace Corvane
