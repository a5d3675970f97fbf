// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_STRANGER_H
#define CORVANE_TEST_STRANGER_H

#include "phonerecord.h"
#include "random.h"

#include <QtCore/QElapsedTimer>
#include <QtCore/QStringList>

#include <deque>
#include <map>
#include <memory>
#include <set>
#include <vector>

struct RunSettings {
    quint64 seed = 1;
    quint64 messages = 3000;
    quint64 from = 0; ///< the first life
    quint64 lives = 0; ///< how many; 0 for as many as the messages take
    QStringList classes; ///< that take turns
    bool hasAllClasses = true;
    bool verbose = false;
    int patience = 60; ///< seconds without a sign of life that are taken for a hang
};

/**
 * Stands in for all services of the phone, and says anything at all.
 *
 * A subject, a process of its own, makes objects of the library, uses and destroys them: one life after the
 * other. Each call of it is answered, and signals come when it asks for some. What is said depends on the
 * seed, the life, and what was called how often in it: so a life is the same again, alone or after others.
 */
class Stranger
{
public:
    explicit Stranger(const RunSettings &settings);
    ~Stranger();

    /** Starts @p subject with @p arguments; returns the exit status of the program. */
    int run(const QByteArray &subject, const QByteArrayList &arguments);

private:
    using Variant = Corvane::Simulator::Variant;
    template <typename T> using Pointer = Corvane::Simulator::GObjectPointer<T>;

    struct Incoming;
    struct Held {
        Pointer<GDBusConnection> connection;
        Pointer<GDBusMessage> answer;
        QByteArray what;
    };
    struct Sent {
        QByteArray what;
        Variant arguments;
    };

    void takeOver();
    void listen(GDBusConnection *connection);
    bool startSubject(const QByteArray &subject, const QByteArrayList &arguments);
    void subjectEnded(int waitStatus);
    void watchForHangs();

    void handle(GDBusConnection *connection, GDBusMessage *call);
    void handleDriver(GDBusMessage *call);
    Variant nextLife();
    void remember(GDBusMessage *call);
    void answer(GDBusConnection *connection, GDBusMessage *call);
    Variant answerTo(GDBusMessage *call, Random &random) const;
    Variant argumentsOf(const QByteArray &signature, Random &random) const;
    Pointer<GDBusMessage> errorTo(GDBusMessage *call, Random &random) const;
    void releaseHeld();

    void say(quint32 count);
    void sendSignal(Random &random);
    bool sendCall(Random &random);
    const Offer &offerToSignal(Random &random) const;
    void flipName(Random &random);
    void setNameOwned(const QByteArray &name, bool isOwned);
    void send(GDBusConnection *connection, GDBusMessage *message, const Variant &arguments,
              const QByteArray &what);
    QByteArray describeLast() const;
    QByteArray replayCommand() const;

    const RunSettings m_settings;
    GMainLoop *const m_loop;
    Pointer<GDBusConnection> m_bus;
    std::unique_ptr<PhoneRecord> m_record;

    GPid m_subject = 0;
    QByteArray m_subjectName; ///< on the bus
    QElapsedTimer m_sinceLastCall;
    bool m_hangs = false;
    bool m_isOver = false; ///< the subject has been told to end
    int m_status = 1;

    quint64 m_life = 0;
    quint64 m_livesLived = 0;
    QString m_class;
    std::map<QByteArray, quint64> m_counts; ///< of calls in this life, by what was called
    std::map<QString, std::set<QByteArray>> m_touched; ///< services and interfaces that a class has called
    QByteArrayList m_clientPaths; ///< objects of the subject that it has told of in this life
    QByteArrayList m_namesAway;
    std::deque<Held> m_held;
    guint m_heldTimer = 0;

    quint64 m_answers = 0;
    quint64 m_signals = 0;
    quint64 m_calls = 0;
    quint64 m_departures = 0;
    quint64 m_sentInLife = 0;
    std::deque<Sent> m_last;
    qint64 m_memoryAtStart = 0;
};

#endif // CORVANE_TEST_STRANGER_H
