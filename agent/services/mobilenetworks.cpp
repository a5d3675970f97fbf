// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mobilenetworks.h"

#include "simcards.h"
#include "warningcapture.h"

#include <algorithm>
#include <memory>

namespace Corvane
{
namespace Agent
{

using Mdm::ConnectivitySettings;
using Mdm::SimInfo;

namespace
{

/** A warning of the library, and what it says in the words of this program; "%1" is what the pattern
 * captures. */
struct Failure {
    QString pattern;
    QString text; ///< empty: nothing that anybody has to know; "%1" alone: why the service refused
    Service service; ///< that failed
};

const QVector<Failure> &failures()
{
    const Service telephony = Service::telephony();
    const Service manager = Service::connectionManager();
    const QString refused = QStringLiteral("%1");
    static const QVector<Failure> all{
        {QStringLiteral("^Unable to (?:determine modem manager interface version|get modem manager interface "
                        "properties|get modems|get radio settings properties|set the preferred radio "
                        "technology|get contexts|set the default data SIM|get access point settings): "
                        "\"(.*)\"$"),
         refused, telephony},
        // The way to the access points of one SIM is an interface that a stock service lacks.
        {QStringLiteral(
             R"re(^Unable to set the default data SIM: "(?:No such interface |Method .* doesn't exist))re"),
         SimCards::untold().text, telephony},
        {QStringLiteral("^Unable to set (.*) for the given IMSI: "),
         telephony.toString() + QLatin1String(" did not take the %1"), telephony},
        {QStringLiteral("^(?:No such modem path|Unsupported cellular technologies selection)"),
         QStringLiteral("the modem does not offer this"), telephony},
        // A slot without a SIM, or with one that nobody has unlocked.
        {QStringLiteral("^Subscriber Identity property not returned for SIM: "), QString(), telephony},
        {QStringLiteral("^Unable to find \"internet\" connection context for IMSI: \"(.*)\"$"),
         QStringLiteral("SIM %1 has no access point for the internet"), telephony},
        {QStringLiteral("^Unable to find \\d+ connection context for IMSI: \"(.*)\"$"),
         QStringLiteral("SIM %1 has no access point of this type"), telephony},
        {QStringLiteral("^Unable to (?:connect|disconnect): \"(.*)\"$"), refused, manager},
        {QStringLiteral("^Unable to set auto connect: \"(.*)\"$"),
         manager.toString() + QLatin1String(" does not change what comes up by itself: %1"), manager},
        {QStringLiteral("^Unable to read network services"),
         manager.toString() + QLatin1String(" does not tell its networks"), manager},
        {QStringLiteral("^Unable to find network service: .* from IMSI: \"(.*)\"$"),
         manager.toString()
             + QLatin1String(" has no network for SIM %1; is flight mode on, or the SIM not registered?"),
         manager},
        {QStringLiteral("^Connection State property not returned for connection: .* from IMSI: \"(.*)\"$"),
         manager.toString() + QLatin1String(" does not tell whether mobile data is up through SIM %1"),
         manager},
        {QStringLiteral("^\"(.*)\"$"), refused, manager},
    };
    return all;
}

QString textOf(const Failure &failure, const QString &captured)
{
    if (failure.text == QLatin1String("%1"))
        return failure.service.refusal(captured);
    return failure.text.contains(QLatin1String("%1")) ? failure.text.arg(captured) : failure.text;
}

/** Has @p question asked; what fails of it is in the reply, in the order of the failures. */
Reply ask(const std::function<void()> &question)
{
    QStringList texts;
    Reply lost;
    std::vector<std::unique_ptr<WarningCapture>> captures;
    for (const Failure &failure : failures()) {
        captures.push_back(std::make_unique<WarningCapture>(failure.pattern, [&](const QString &captured) {
            const QString text = textOf(failure, captured);
            if (!text.isEmpty() && !texts.contains(text))
                texts.append(text);
            // A service that died under the question explains the failure better than the bus does.
            if (lost.isDone() && !failure.service.isRunning())
                lost = failure.service.notRunning();
        }));
    }
    question();
    if (texts.isEmpty() || !lost.isDone())
        return lost;
    return {Reply::Refused, texts.join(QLatin1String("; "))};
}

/** In the order in which a modem grows. */
struct NamedTechnologies {
    QLatin1String name;
    Technologies technologies;
};

const NamedTechnologies namedTechnologies[] = {
    {QLatin1String("any"), ConnectivitySettings::TechnologyNone},
    {QLatin1String("2g"), ConnectivitySettings::Technology2G},
    {QLatin1String("3g"), ConnectivitySettings::Technology2G | ConnectivitySettings::Technology3G},
    {QLatin1String("4g"),
     ConnectivitySettings::Technology2G | ConnectivitySettings::Technology3G
         | ConnectivitySettings::Technology4G},
};

} // namespace

QString technologiesName(Technologies technologies)
{
    for (const NamedTechnologies &named : namedTechnologies) {
        if (named.technologies == technologies)
            return named.name;
    }
    return QStringLiteral("other");
}

std::optional<Technologies> technologiesNamed(const QString &name)
{
    for (const NamedTechnologies &named : namedTechnologies) {
        if (named.name == name)
            return named.technologies;
    }
    return std::nullopt;
}

QStringList technologiesNames()
{
    QStringList names;
    for (const NamedTechnologies &named : namedTechnologies)
        names.append(named.name);
    return names;
}

MobileNetworks::MobileNetworks(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
}

Answer<QVector<MobileNetworks::Modem>> MobileNetworks::modems() const
{
    Answer<QVector<Modem>> answer;
    answer.reply = ask([&] {
        const QStringList paths = m_settings.modemPaths();
        for (const QString &path : paths)
            answer.value.append({path, m_settings.modemSimImsi(path)});
    });
    return answer;
}

Answer<QVector<Technologies>> MobileNetworks::supported(const QString &modemPath) const
{
    Answer<QVector<Technologies>> answer;
    answer.reply = ask([&] { answer.value = m_settings.supportedCellularTechnologies(modemPath); });
    answer.value.removeAll(ConnectivitySettings::TechnologyNone);
    return answer;
}

Answer<Technologies> MobileNetworks::selected(const QString &modemPath) const
{
    Answer<Technologies> answer;
    answer.reply = ask([&] { answer.value = m_settings.selectedCellularTechnologies(modemPath); });
    return answer;
}

Reply MobileNetworks::select(const QString &modemPath, Technologies technologies)
{
    return ask([&] { m_settings.selectCellularTechnologies(modemPath, technologies); });
}

Answer<QStringList> MobileNetworks::imsis() const
{
    Answer<QStringList> answer;
    answer.reply = ask([&] { answer.value = m_settings.mobileNetworkImsis(); });
    return answer;
}

Reply MobileNetworks::ensureSim(const QString &imsi) const
{
    const Answer<QVector<Modem>> known = modems();
    const bool isThere = std::any_of(known.value.cbegin(), known.value.cend(),
                                     [&imsi](const Modem &modem) { return modem.imsi == imsi; });
    if (!known.reply.isDone() || isThere)
        return known.reply;
    return {Reply::Refused, QStringLiteral("no SIM %1 in the phone").arg(imsi)};
}

Answer<bool> MobileNetworks::isConnected(const QString &imsi) const
{
    Answer<bool> answer;
    answer.reply = ensureSim(imsi);
    if (answer.reply.isDone())
        answer.reply = ask([&] { answer.value = m_settings.isConnectedToMobileNetwork(imsi); });
    return answer;
}

Reply MobileNetworks::setConnected(const QString &imsi, bool connected)
{
    const Reply there = ensureSim(imsi);
    if (!there.isDone())
        return there;
    return ask([&] {
        if (connected)
            m_settings.connectToMobileNetwork(imsi);
        else
            m_settings.disconnectFromMobileNetwork(imsi);
    });
}

QString MobileNetworks::dataSim() const
{
    // Made anew each time: one that follows the phone may not have taken in yet what was changed here.
    SimCards cards(m_timeout);
    if (!cards.open().isDone())
        return QString();
    const QList<SimInfo::SimState> states = cards.info().simSlotStates();
    const auto data = std::find_if(states.cbegin(), states.cend(), [](const SimInfo::SimState &state) {
        return state.present && state.dataSim;
    });
    return data == states.cend() ? QString() : data->imsi;
}

Answer<QMap<QString, MobileNetworks::AccessPoints>> MobileNetworks::accessPoints(
    const QStringList &imsis) const
{
    const QString data = dataSim();
    QStringList order = imsis;
    if (!data.isEmpty() && imsis != QStringList(data)) {
        order.removeAll(data);
        order.append(data);
    }
    Answer<QMap<QString, AccessPoints>> answer;
    answer.reply = ask([&] {
        for (const QString &imsi : qAsConst(order)) {
            const AccessPoints accessPoints = m_settings.accessPointSettings(imsi);
            if (imsis.contains(imsi))
                answer.value.insert(imsi, accessPoints);
        }
    });
    return answer;
}

Reply MobileNetworks::setAccessPoint(const QString &imsi, const AccessPoint &accessPoint)
{
    const Reply there = ensureSim(imsi);
    if (!there.isDone())
        return there;
    const QString data = dataSim();
    bool taken = false;
    const Reply reply = ask([&] {
        taken = m_settings.setAccessPointSettings(imsi, accessPoint);
        if (!data.isEmpty() && data != imsi)
            m_settings.accessPointSettings(data);
    });
    if (taken || !reply.isDone())
        return reply;
    return {Reply::Refused, QStringLiteral("SIM %1 has no access points").arg(imsi)};
}

} // namespace Agent
} // namespace Corvane
