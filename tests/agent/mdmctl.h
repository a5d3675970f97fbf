// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_MDMCTL_H
#define CORVANE_TEST_MDMCTL_H

#include <QtCore/QByteArray>
#include <QtCore/QJsonObject>
#include <QtCore/QProcess>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVector>

class Terminal;

/** mdmctl, as it is run by a person or a script. */
class Mdmctl
{
public:
    struct Result {
        int status; ///< -1 when it was killed by a signal
        QString output;
        QString errors;

        QJsonObject json() const; ///< all of the output
        QVector<QJsonObject> jsonLines() const;
    };

    /** QtDBus's time-out in milliseconds, and the shortest one of mdmctl's own: a run that takes less has
     * waited for nothing that did not come, however busy the machine is. */
    static constexpr int shortestTimeout = 25000;

    /** Runs it to its end. */
    static Result run(const QStringList &arguments, const QByteArray &input = QByteArray());

    /** Starts it, on @p terminal if there is one, with its streams elsewhere. */
    explicit Mdmctl(const QStringList &arguments, const Terminal *terminal = nullptr);
    ~Mdmctl();

    /** Waits until it has written @p text to its standard output, @p times times. */
    bool waitForOutput(const QString &text, int times = 1);
    /** The same for standard error. */
    bool waitForErrors(const QString &text);

    qint64 processId() const;
    void interrupt(int signal);
    Result finish();

private:
    Q_DISABLE_COPY(Mdmctl)

    class Process : public QProcess
    {
    public:
        const Terminal *terminal = nullptr;

    protected:
        void setupChildProcess() override;
    };

    Process m_process;
    QByteArray m_output;
    QByteArray m_errors;
};

#endif // CORVANE_TEST_MDMCTL_H
