// SPDX-License-Identifier: LGPL-2.1-or-later
// Classes that make the mistakes which random messages are to find.
#include "testedclass.h"

#include <QtCore/QThread>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString Path = QStringLiteral("/");
const QString Interface = QStringLiteral("org.ofono.Manager");

QDBusMessage ask()
{
    return QDBusConnection::systemBus().call(
        QDBusMessage::createMethodCall(Service, Path, Interface, QStringLiteral("GetModems")));
}

} // namespace

class Listener : public QObject
{
    Q_OBJECT

public:
    explicit Listener(QObject *parent)
        : QObject(parent)
    {
        QDBusConnection::systemBus().connect(Service, QString(), Interface, QStringLiteral("ModemRemoved"),
                                             this, SLOT(removed(QDBusMessage)));
        ask();
    }

protected:
    virtual void hear(const QDBusMessage &signal) = 0;

private Q_SLOTS:
    void removed(const QDBusMessage &signal) { hear(signal); }
};

/** Makes none. */
class Careful : public Listener
{
public:
    using Listener::Listener;

protected:
    void hear(const QDBusMessage &) override { }
};

/** Believes that a modem is named by its path. */
class Trusting : public Listener
{
public:
    using Listener::Listener;

protected:
    void hear(const QDBusMessage &signal) override
    {
        if (signal.signature() != QLatin1String("o"))
            qFatal("this is no path");
    }
};

/** Waits for what never comes. */
class Stubborn : public Listener
{
public:
    using Listener::Listener;

protected:
    void hear(const QDBusMessage &) override { QThread::sleep(300); }
};

/** Frees nothing. */
class Forgetful : public Listener
{
public:
    using Listener::Listener;

protected:
    void hear(const QDBusMessage &) override { m_heard = new int(1); }

private:
    int *m_heard = nullptr;
};

const std::vector<TestedClass> &testedClasses()
{
    static const std::vector<TestedClass> classes{
        testedClass<Careful>("Careful", {}),
        testedClass<Trusting>("Trusting", {}),
        testedClass<Stubborn>("Stubborn", {}),
        testedClass<Forgetful>("Forgetful", {}),
    };
    return classes;
}

#include "mistakes.moc"
