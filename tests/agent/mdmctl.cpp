// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"

#include "terminal.h"
#include "waiting.h"

#include <QtCore/QJsonDocument>

#include <csignal>

QJsonObject Mdmctl::Result::json() const
{
    return QJsonDocument::fromJson(output.toUtf8()).object();
}

QVector<QJsonObject> Mdmctl::Result::jsonLines() const
{
    QVector<QJsonObject> objects;
    const QStringList lines = output.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    for (const QString &line : lines)
        objects.append(QJsonDocument::fromJson(line.toUtf8()).object());
    return objects;
}

Mdmctl::Result Mdmctl::run(const QStringList &arguments, const QByteArray &input)
{
    Mdmctl mdmctl(arguments);
    mdmctl.m_process.write(input);
    mdmctl.m_process.closeWriteChannel();
    return mdmctl.finish();
}

void Mdmctl::Process::setupChildProcess()
{
    if (terminal)
        terminal->adopt();
}

Mdmctl::Mdmctl(const QStringList &arguments, const Terminal *terminal)
{
    m_process.terminal = terminal;
    QObject::connect(&m_process, &QProcess::readyReadStandardOutput, &m_process,
                     [this] { m_output += m_process.readAllStandardOutput(); });
    QObject::connect(&m_process, &QProcess::readyReadStandardError, &m_process,
                     [this] { m_errors += m_process.readAllStandardError(); });
    m_process.start(QStringLiteral(MDMCTL), arguments);
    if (!m_process.waitForStarted())
        qFatal("cannot run %s", MDMCTL);
}

Mdmctl::~Mdmctl()
{
    if (m_process.state() == QProcess::NotRunning)
        return;
    m_process.kill();
    m_process.waitForFinished();
}

bool Mdmctl::waitForOutput(const QString &text, int times)
{
    return waitUntil([&] { return QString::fromUtf8(m_output).count(text) >= times; });
}

bool Mdmctl::waitForErrors(const QString &text)
{
    return waitUntil([&] { return QString::fromUtf8(m_errors).contains(text); });
}

qint64 Mdmctl::processId() const
{
    return m_process.processId();
}

void Mdmctl::interrupt(int signal)
{
    ::kill(pid_t(m_process.processId()), signal);
}

Mdmctl::Result Mdmctl::finish()
{
    if (!waitUntil([this] { return m_process.state() == QProcess::NotRunning; }))
        qFatal("mdmctl does not end");
    m_output += m_process.readAllStandardOutput();
    m_errors += m_process.readAllStandardError();
    const int status = m_process.exitStatus() == QProcess::NormalExit ? m_process.exitCode() : -1;
    return {status, QString::fromUtf8(m_output), QString::fromUtf8(m_errors)};
}
