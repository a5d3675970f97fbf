// SPDX-License-Identifier: LGPL-2.1-or-later
#include "subject.h"

#include "drivernames.h"
#include "random.h"
#include "testedclass.h"
#include "waiting.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QMetaMethod>
#include <QtCore/QMetaProperty>
#include <QtCore/QPointer>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>

#include <cstdio>
#include <memory>

#if defined(__SANITIZE_ADDRESS__)
#include <sanitizer/lsan_interface.h>
#endif

namespace
{

constexpr int livesBetweenLeakChecks = 250;

bool s_isVerbose = false;

void log(const char *action, const char *what)
{
    if (s_isVerbose)
        std::fprintf(stderr, "    %s %s\n", action, what);
}

QDBusMessage driverCall(const char *member, const QVariantList &arguments = {})
{
    QDBusMessage call = QDBusMessage::createMethodCall(
        QLatin1String(DriverNames::service), QLatin1String(DriverNames::path),
        QLatin1String(DriverNames::interface), QLatin1String(member));
    call.setArguments(arguments);
    return call;
}

/** Asks for @p count messages and waits, in the event loop, until all that was sent so far has been taken in.
 */
void letHappen(uint count)
{
    QDBusPendingCallWatcher watcher(
        QDBusConnection::systemBus().asyncCall(driverCall(DriverNames::emit, {count})));
    bool finished = false;
    QObject::connect(&watcher, &QDBusPendingCallWatcher::finished, [&finished] { finished = true; });
    if (!waitUntil([&finished] { return finished; }))
        qFatal("the stranger does not answer");
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

/** Most of them of the type that the property has. */
QVariant valueFor(const QMetaProperty &property, ArgumentSource &source)
{
    if (source.random.chance(20))
        return randomArgument<QVariant>(source);
    if (property.isEnumType())
        return randomArgument<int>(source);
    switch (property.userType()) {
    case QMetaType::Bool:
        return randomArgument<bool>(source);
    case QMetaType::Int:
        return randomArgument<int>(source);
    case QMetaType::QString:
        return randomArgument<QString>(source);
    case QMetaType::QStringList:
        return randomArgument<QStringList>(source);
    case QMetaType::QUrl:
        return randomArgument<QUrl>(source);
    case QMetaType::QVariantMap:
        return randomArgument<QVariantMap>(source);
    default:
        if (property.userType() == qMetaTypeId<QList<QUrl>>())
            return QVariant::fromValue(randomArgument<QList<QUrl>>(source));
        return randomArgument<QVariant>(source);
    }
}

/** One life: objects are made, used and destroyed while messages come. */
class Life
{
public:
    Life(quint64 seed, quint64 number, const QString &firstClass, const QStringList &words);
    void live();

private:
    class Member;

    void step();
    void create(const TestedClass &tested);
    void destroy(std::size_t index);
    void prune();

    Random m_random;
    ArgumentSource m_arguments;
    const TestedClass *m_first;
    QObject m_parent;
    std::vector<std::unique_ptr<Member>> m_members;
};

/** An object, and a listener to all of its signals that sometimes does what a receiver may do. */
class Life::Member : public QObject
{
public:
    Member(const TestedClass &tested, QObject *object, Random &random, ArgumentSource &arguments);

    QObject *object() const { return m_object; }
    void performSomething();
    void readProperties() const;
    void writeProperty();

    int qt_metacall(QMetaObject::Call call, int id, void **arguments) override;

private:
    const TestedClass &m_tested;
    QPointer<QObject> m_object;
    Random &m_random;
    ArgumentSource &m_arguments;
    int m_underWay = 0; ///< functions of the object that have not returned
};

Life::Member::Member(const TestedClass &tested, QObject *object, Random &random, ArgumentSource &arguments)
    : m_tested(tested)
    , m_object(object)
    , m_random(random)
    , m_arguments(arguments)
{
    const QMetaObject *metaObject = object->metaObject();
    const int firstSlot = QObject::staticMetaObject.methodCount();
    for (int index = QObject::staticMetaObject.methodCount(); index < metaObject->methodCount(); ++index) {
        if (metaObject->method(index).methodType() == QMetaMethod::Signal)
            QMetaObject::connect(object, index, this, firstSlot, Qt::DirectConnection, nullptr);
    }
}

int Life::Member::qt_metacall(QMetaObject::Call call, int id, void **arguments)
{
    id = QObject::qt_metacall(call, id, arguments);
    if (id < 0 || call != QMetaObject::InvokeMetaMethod)
        return id;
    const int choice = m_random.below(100);
    if (choice < 3 && m_underWay == 0) {
        log("delete in a signal", m_tested.name);
        delete m_object;
    } else if (choice < 6) {
        log("delete later in a signal", m_tested.name);
        m_object->deleteLater();
    } else if (choice < 12 && m_underWay < 3) {
        performSomething();
    } else if (choice < 40) {
        readProperties();
    }
    return -1;
}

void Life::Member::performSomething()
{
    if (m_tested.operations.empty())
        return;
    const Operation &operation = m_random.pick(m_tested.operations);
    log(m_tested.name, operation.name);
    ++m_underWay;
    operation.perform(m_object, m_arguments);
    --m_underWay;
}

void Life::Member::readProperties() const
{
    const QMetaObject *metaObject = m_object->metaObject();
    for (int index = 1; index < metaObject->propertyCount(); ++index)
        static_cast<void>(metaObject->property(index).read(m_object).toString());
}

void Life::Member::writeProperty()
{
    const QMetaObject *metaObject = m_object->metaObject();
    const QMetaProperty property = metaObject->property(m_random.below(metaObject->propertyCount()));
    log("write", property.name());
    ++m_underWay;
    property.write(m_object, valueFor(property, m_arguments));
    --m_underWay;
}

Life::Life(quint64 seed, quint64 number, const QString &firstClass, const QStringList &words)
    : m_random(seed, number, "life")
    , m_arguments{m_random, words}
    , m_first(nullptr)
{
    for (const TestedClass &tested : testedClasses()) {
        if (firstClass == QLatin1String(tested.name))
            m_first = &tested;
    }
    if (!m_first)
        qFatal("there is no class %s", qUtf8Printable(firstClass));
}

void Life::live()
{
    create(*m_first);
    for (int left = m_random.below(16) + 4; left > 0; --left)
        step();
    while (!m_members.empty())
        destroy(m_members.size() - 1);
    // What is said to those that are dead.
    letHappen(uint(m_random.below(4)));
}

void Life::step()
{
    prune();
    const int choice = m_random.below(20);
    if (m_members.empty() || choice == 0) {
        create(choice < 10 ? *m_first : m_random.pick(testedClasses()));
        return;
    }
    const auto index = std::size_t(m_random.below(int(m_members.size())));
    if (choice < 8)
        m_members[index]->performSomething();
    else if (choice < 10)
        m_members[index]->writeProperty();
    else if (choice < 11)
        m_members[index]->readProperties();
    else if (choice < 12)
        destroy(index);
    else
        letHappen(uint(m_random.below(8)));
}

void Life::create(const TestedClass &tested)
{
    log("create", tested.name);
    QObject *object = tested.create(m_random.chance(30) ? &m_parent : nullptr, m_arguments);
    m_members.push_back(std::make_unique<Member>(tested, object, m_random, m_arguments));
}

void Life::destroy(std::size_t index)
{
    if (QObject *object = m_members[index]->object()) {
        log("destroy", object->metaObject()->className());
        if (m_random.chance(30))
            object->deleteLater();
        else
            delete object;
    }
    m_members.erase(m_members.begin() + std::ptrdiff_t(index));
}

/** Forgets the objects that a listener has deleted. */
void Life::prune()
{
    for (std::size_t index = m_members.size(); index-- > 0;) {
        if (!m_members[index]->object())
            m_members.erase(m_members.begin() + std::ptrdiff_t(index));
    }
}

void checkForLeaks()
{
#if defined(__SANITIZE_ADDRESS__)
    if (__lsan_do_recoverable_leak_check())
        qFatal("there is a leak in one of the last %d lives", livesBetweenLeakChecks);
#endif
}

/** The library warns of nearly everything that happens here. */
void dropMessage(QtMsgType type, const QMessageLogContext &, const QString &message)
{
    if (!s_isVerbose && type != QtFatalMsg)
        return;
    std::fprintf(stderr, "      %s\n", qUtf8Printable(message.left(400)));
}

} // namespace

int runSubject(bool verbose)
{
    s_isVerbose = verbose;
    qInstallMessageHandler(dropMessage);
    const QDBusConnection bus = QDBusConnection::systemBus();
    const QStringList words = bus.call(driverCall(DriverNames::words)).arguments().value(0).toStringList();
    for (int lives = 1;; ++lives) {
        const QVariantList next = bus.call(driverCall(DriverNames::next)).arguments();
        const QString firstClass = next.value(2).toString();
        if (firstClass.isEmpty())
            break;
        Life(next.value(0).toULongLong(), next.value(1).toULongLong(), firstClass, words).live();
        if (lives % livesBetweenLeakChecks == 0)
            checkForLeaks();
    }
    return 0;
}
