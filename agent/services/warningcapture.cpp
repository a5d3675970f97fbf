// SPDX-License-Identifier: LGPL-2.1-or-later
#include "warningcapture.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QThread>

#include <algorithm>
#include <cstdio>
#include <vector>

namespace Corvane
{
namespace Agent
{

namespace
{

std::vector<const WarningCapture *> &captures()
{
    static std::vector<const WarningCapture *> all;
    return all;
}

QByteArray &messagePrefix()
{
    static QByteArray prefix;
    return prefix;
}

/** @p text as it was before QDebug put it between quotation marks. */
QString unescaped(QString text)
{
    static const QRegularExpression escape(QStringLiteral(R"re(\\(["\\]))re"));
    return text.replace(escape, QStringLiteral("\\1"));
}

bool onMainThread()
{
    return !qApp || qApp->thread() == QThread::currentThread();
}

} // namespace

WarningCapture::WarningCapture(const QString &pattern, std::function<void(const QString &)> taker)
    : m_pattern(pattern)
    , m_taker(std::move(taker))
{
    captures().push_back(this);
}

WarningCapture::~WarningCapture()
{
    auto &all = captures();
    all.erase(std::remove(all.begin(), all.end(), this), all.end());
}

void WarningCapture::install(const QByteArray &prefix)
{
    messagePrefix() = prefix;
    qInstallMessageHandler(handle);
}

QString WarningCapture::reasonOf(const QString &warning)
{
    static const QRegularExpression nameAndMessage(QStringLiteral(R"re("([^" ]+)",? "(.*)"\)?$)re"));
    const QRegularExpressionMatch match = nameAndMessage.match(warning);
    if (!match.hasMatch())
        return warning;
    const QString name = match.captured(1);
    const QString message = unescaped(match.captured(2));
    return message.isEmpty() ? name : QStringLiteral("%1 (%2)").arg(message, name);
}

void WarningCapture::handle(QtMsgType type, const QMessageLogContext &, const QString &message)
{
    if (type == QtDebugMsg || type == QtInfoMsg)
        return;
    if (onMainThread()) {
        const auto taken
            = std::find_if(captures().crbegin(), captures().crend(),
                           [&](const WarningCapture *capture) { return capture->take(message); });
        if (taken != captures().crend())
            return;
    }
    const QByteArray line = messagePrefix() + "warning: " + message.toLocal8Bit() + '\n';
    std::fwrite(line.constData(), 1, std::size_t(line.size()), stderr);
}

bool WarningCapture::take(const QString &message) const
{
    const QRegularExpressionMatch match = m_pattern.match(message);
    if (!match.hasMatch())
        return false;
    m_taker(match.lastCapturedIndex() > 0 ? unescaped(match.captured(1)) : reasonOf(message));
    return true;
}

} // namespace Agent
} // namespace Corvane
