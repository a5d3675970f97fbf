// SPDX-License-Identifier: LGPL-2.1-or-later
#include "signalsequence.h"

#include "waiting.h"

#include <corvanemdm/callstatistics.h>
#include <corvanemdm/certificates.h>
#include <corvanemdm/networkdatacounter.h>
#include <corvanemdm/simfilter.h>
#include <corvanemdm/siminfo.h>

#include <QtCore/QUrl>

using Corvane::Mdm::CallStatistics;
using Corvane::Mdm::CertificateFile;
using Corvane::Mdm::Certificates;
using Corvane::Mdm::NetworkDataCounter;
using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimInfo;

namespace
{

QString text(const SimFilter::Rule &rule)
{
    static const char *const actions[] = {"?", "block", "allow", "hangup"};
    return rule.imsi + QLatin1Char(':') + QLatin1String(actions[rule.action]);
}

QString text(const CallStatistics::Result &result)
{
    return result.time.toString(Qt::ISODate) + QLatin1Char('=') + QString::number(result.value);
}

QString text(const NetworkDataCounter::Update &update)
{
    static const char *const types[] = {"home", "roaming", "wlan"};
    return QStringLiteral("%1 %2 tx:%3 rx:%4 time:%5")
        .arg(update.identifier, QLatin1String(types[update.type]))
        .arg(update.txBytes)
        .arg(update.rxBytes)
        .arg(update.time);
}

QString text(const QUrl &url)
{
    return url.toString();
}

template <typename T> QString text(const QList<T> &list)
{
    QStringList texts;
    for (const T &item : list)
        texts.append(text(item));
    return QLatin1Char('[') + texts.join(QLatin1Char(' ')) + QLatin1Char(']');
}

QString text(const QVariant &value);

QString text(const QVariantMap &map)
{
    QStringList texts;
    for (auto member = map.begin(); member != map.end(); ++member)
        texts.append(member.key() + QLatin1Char('=') + text(member.value()));
    return QLatin1Char('{') + texts.join(QLatin1Char(' ')) + QLatin1Char('}');
}

QString text(const QVariant &value)
{
    if (value.userType() == QMetaType::QVariantMap)
        return text(value.toMap());
    if (value.userType() == QMetaType::QStringList)
        return value.toStringList().join(QLatin1Char(' '));
    return value.toString();
}

QString text(int type, const void *value)
{
    if (type == qMetaTypeId<SimFilter::Rule>())
        return text(*static_cast<const SimFilter::Rule *>(value));
    if (type == qMetaTypeId<SimFilter::RuleList>())
        return text(*static_cast<const SimFilter::RuleList *>(value));
    if (type == qMetaTypeId<QList<CallStatistics::Result>>())
        return text(*static_cast<const QList<CallStatistics::Result> *>(value));
    if (type == qMetaTypeId<SimInfo::SimState>())
        return simStateText(*static_cast<const SimInfo::SimState *>(value));
    if (type == qMetaTypeId<CertificateFile>())
        return static_cast<const CertificateFile *>(value)->fileName();
    if (type == qMetaTypeId<Certificates::Result>())
        return QString::number(*static_cast<const Certificates::Result *>(value));
    if (type == qMetaTypeId<NetworkDataCounter::Update>())
        return text(*static_cast<const NetworkDataCounter::Update *>(value));
    if (type == qMetaTypeId<QList<QUrl>>())
        return text(*static_cast<const QList<QUrl> *>(value));
    if (type == QMetaType::UnknownType)
        return QStringLiteral("<type unknown to the meta-object system>");
    return text(QVariant(type, value));
}

} // namespace

QString simStateText(const SimInfo::SimState &state)
{
    QStringList words{state.modemPath};
    if (state.present)
        words << QStringLiteral("present");
    if (state.voiceSim)
        words << QStringLiteral("voice");
    if (state.dataSim)
        words << QStringLiteral("data");
    if (state.enabled)
        words << QStringLiteral("enabled");
    words << QStringLiteral("pin:%1").arg(state.pinRequired)
          << QStringLiteral("net:%1").arg(state.networkRegistration) << state.imsi;
    return words.join(QLatin1Char(' ')).trimmed();
}

SignalSequence::SignalSequence(QObject *object)
{
    const QMetaObject *metaObject = object->metaObject();
    const int firstSlot = QObject::staticMetaObject.methodCount();
    // From all classes but QObject.
    for (int index = firstSlot; index < metaObject->methodCount(); ++index) {
        const QMetaMethod method = metaObject->method(index);
        if (method.methodType() != QMetaMethod::Signal)
            continue;
        QMetaObject::connect(object, index, this, firstSlot + m_signals.size(), Qt::DirectConnection,
                             nullptr);
        m_signals.append(method);
    }
}

QStringList SignalSequence::take()
{
    QStringList seen;
    seen.swap(m_seen);
    return seen;
}

bool SignalSequence::waitFor(int count)
{
    return waitUntil([&] { return m_seen.size() >= count; });
}

int SignalSequence::qt_metacall(QMetaObject::Call call, int id, void **arguments)
{
    id = QObject::qt_metacall(call, id, arguments);
    if (id < 0 || call != QMetaObject::InvokeMetaMethod)
        return id;

    const QMetaMethod &method = m_signals.at(id);
    QStringList texts;
    for (int index = 0; index < method.parameterCount(); ++index)
        texts.append(text(method.parameterType(index), arguments[index + 1]));
    m_seen.append(QString::fromLatin1(method.name()) + QLatin1Char('(') + texts.join(QLatin1String(", "))
                  + QLatin1Char(')'));
    return -1;
}
