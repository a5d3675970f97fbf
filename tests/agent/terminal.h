// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_TERMINAL_H
#define CORVANE_TEST_TERMINAL_H

#include <QtCore/QByteArray>
#include <QtCore/QSocketNotifier>

#include <memory>

/** A terminal that a test plays the person at. */
class Terminal
{
public:
    Terminal();
    ~Terminal();

    /** Makes it the terminal of the calling process, which is about to become a program. */
    void adopt() const;

    bool waitForText(const QByteArray &text);
    void type(const QByteArray &keys) const;
    /** Whether what is typed is shown. */
    bool echoes() const;

    /** All that was shown so far. */
    QByteArray shown() const { return m_shown; }

private:
    Q_DISABLE_COPY(Terminal)

    int m_person;
    int m_program;
    QByteArray m_shown;
    std::unique_ptr<QSocketNotifier> m_notifier;
};

#endif // CORVANE_TEST_TERMINAL_H
