// SPDX-License-Identifier: LGPL-2.1-or-later
#include "atmodem.h"

#include "simcard.h"

#include <algorithm>
#include <utility>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QString ok = QStringLiteral("OK");
const QString noCard = QStringLiteral("+CME ERROR: 10");
const QString pinWanted = QStringLiteral("+CME ERROR: 11");
const QString pukWanted = QStringLiteral("+CME ERROR: 12");
const QString wrongPassword = QStringLiteral("+CME ERROR: 16");
const QString notAllowed = QStringLiteral("+CME ERROR: 3");
const QString noService = QStringLiteral("+CME ERROR: 30");
const QString notUnderstood = QStringLiteral("ERROR");

// What a card requires, in oFono's words.
const QString nothingRequired = QStringLiteral("none");
const QString pinRequired = QStringLiteral("pin");
const QString pukRequired = QStringLiteral("puk");

constexpr int pinAttempts = 3;
constexpr int pukAttempts = 10;

/** The kinds of access that +CRSM can ask for. */
enum CardCommand { ReadBinary = 176, ReadRecord = 178, GetResponse = 192 };

// Answers of the card, as two bytes.
const QString done = QStringLiteral("144,0");
const QString fileNotFound = QStringLiteral("106,130");
const QString recordNotFound = QStringLiteral("106,131");
const QString wrongLength = QStringLiteral("103,0");
const QString notPermitted = QStringLiteral("105,130");
const QString unknownCommand = QStringLiteral("109,0");

/** The parts of @p text between separators that are not in quotes. */
QStringList splitOutsideQuotes(const QString &text, QLatin1Char separator)
{
    QStringList parts{QString()};
    bool quoted = false;
    for (const QChar character : text) {
        if (character == QLatin1Char('"'))
            quoted = !quoted;
        if (character == separator && !quoted)
            parts.append(QString());
        else
            parts.last().append(character);
    }
    return parts;
}

QString unquoted(const QString &text)
{
    return text.size() >= 2 && text.startsWith(QLatin1Char('"')) && text.endsWith(QLatin1Char('"'))
        ? text.mid(1, text.size() - 2)
        : text;
}

} // namespace

struct AtModem::Command {
    enum Kind { Execute, Query, Test, Set };

    QString name;
    Kind kind = Execute;
    QStringList arguments;

    bool is(const char *expectedName, Kind expectedKind) const
    {
        return kind == expectedKind && name == QLatin1String(expectedName);
    }
    QString argument(int index) const { return arguments.value(index); }
};

AtModem::AtModem(Sim &sim, std::size_t slot)
    : m_sim(sim)
    , m_slot(slot)
    , m_pin(QStringLiteral("1234"))
    , m_asksForPin(lock() != Unlocked)
    , m_attemptsLeft(lock() == PukLocked ? pukAttempts : pinAttempts)
{
}

AtModem::Lock AtModem::lock() const
{
    return m_sim.pin == pinRequired ? PinLocked : m_sim.pin == pukRequired ? PukLocked : Unlocked;
}

AtModem::Command AtModem::parsed(const QString &text)
{
    Command command;
    const int assignment = text.indexOf(QLatin1Char('='));
    if (text.endsWith(QLatin1String("=?"))) {
        command.kind = Command::Test;
        command.name = text.chopped(2);
    } else if (assignment > 0) {
        command.kind = Command::Set;
        command.name = text.left(assignment);
        const QStringList arguments = splitOutsideQuotes(text.mid(assignment + 1), QLatin1Char(','));
        for (const QString &argument : arguments)
            command.arguments.append(unquoted(argument.trimmed()));
    } else if (text.endsWith(QLatin1Char('?'))) {
        command.kind = Command::Query;
        command.name = text.chopped(1);
    } else {
        command.name = text;
    }
    command.name = command.name.trimmed().toUpper();
    return command;
}

QStringList AtModem::answer(const QString &commandLine)
{
    const QString line = commandLine.trimmed();
    if (line.isEmpty())
        return {};
    if (!line.startsWith(QLatin1String("AT"), Qt::CaseInsensitive))
        return {notUnderstood};
    QStringList lines;
    m_isAnswering = true;
    const QString result = performAll(line.mid(2), lines);
    m_isAnswering = false;
    return lines << result << std::exchange(m_announcements, {});
}

QString AtModem::performAll(const QString &commandLine, QStringList &lines)
{
    const QStringList commands = splitOutsideQuotes(commandLine, QLatin1Char(';'));
    for (const QString &command : commands) {
        const QString result = perform(parsed(command), lines);
        // What comes after a command that failed is not carried out.
        if (result != ok)
            return result;
    }
    return ok;
}

QString AtModem::perform(const Command &command, QStringList &lines)
{
    if (command.is("+CFUN", Command::Query)) {
        lines << QStringLiteral("+CFUN: %1").arg(m_function);
        return ok;
    }
    if (command.is("+CFUN", Command::Set)) {
        const int function = command.argument(0).toInt();
        if (function != MinimumFunction && function != FullFunction && function != RadioOff)
            return notAllowed;
        setFunction(Function(function));
        return ok;
    }
    QString result = performIdentity(command, lines);
    if (result.isEmpty())
        result = performCard(command, lines);
    if (result.isEmpty())
        result = performNetwork(command, lines);
    return result.isEmpty() ? ok : result;
}

QString AtModem::performIdentity(const Command &command, QStringList &lines) const
{
    if (command.is("+CGMI", Command::Execute))
        lines << QStringLiteral("Corvane");
    else if (command.is("+CGMM", Command::Execute))
        lines << QStringLiteral("Emulated modem");
    else if (command.is("+CGMR", Command::Execute))
        lines << QStringLiteral("1.0");
    else if (command.is("+CGSN", Command::Execute))
        lines << QStringLiteral("35824005111110%1").arg(m_slot);
    else
        return QString();
    return ok;
}

QString AtModem::performCard(const Command &command, QStringList &lines)
{
    if (command.is("+SIMSTATE", Command::Query)) {
        lines << QStringLiteral("+USIMSTATE: %1").arg(int(m_sim.present));
        return ok;
    }
    if (command.is("+CPIN", Command::Query)) {
        if (!m_sim.present)
            return noCard;
        static const char *const states[] = {"READY", "SIM PIN", "SIM PUK"};
        lines << QStringLiteral("+CPIN: ") + QLatin1String(states[lock()]);
        return ok;
    }
    if (command.is("+CPIN", Command::Set))
        return enterPin(command.arguments);
    if (command.is("+CPINR", Command::Execute)) {
        lines << QStringLiteral("+CPINR: SIM PIN,%1,%2")
                     .arg(lock() == PukLocked ? 0 : m_attemptsLeft)
                     .arg(pinAttempts);
        lines << QStringLiteral("+CPINR: SIM PUK,%1,%2")
                     .arg(lock() == PukLocked ? m_attemptsLeft : pukAttempts)
                     .arg(pukAttempts);
        return ok;
    }
    if (command.is("+CLCK", Command::Test)) {
        lines << QStringLiteral("+CLCK: (\"SC\")");
        return ok;
    }
    if (command.is("+CLCK", Command::Set)) {
        // Whether the card asks for its PIN; other locks are open.
        if (command.argument(1) == QLatin1String("2"))
            lines << QStringLiteral("+CLCK: %1")
                         .arg(int(command.argument(0) == QLatin1String("SC") && m_asksForPin));
        return ok;
    }
    if (command.is("+CIMI", Command::Execute)) {
        if (!m_sim.present)
            return noCard;
        if (lock() != Unlocked)
            return lock() == PinLocked ? pinWanted : pukWanted;
        lines << m_sim.imsi;
        return ok;
    }
    if (command.is("+CRSM", Command::Set))
        return accessFile(command.arguments, lines);
    return QString();
}

QString AtModem::performNetwork(const Command &command, QStringList &lines)
{
    const bool isRegistered = registration() == Home || registration() == Roaming;
    if (command.name == QLatin1String("+CREG"))
        return performRegistration(command, m_voiceReporting, lines);
    if (command.name == QLatin1String("+CGREG"))
        return performRegistration(command, m_dataReporting, lines);
    if (command.is("+COPS", Command::Query)) {
        const QString name = m_numericOperator ? m_sim.imsi.left(5) : m_sim.provider;
        lines << (isRegistered
                      ? QStringLiteral("+COPS: 0,%1,\"%2\",7").arg(m_numericOperator ? 2 : 0).arg(name)
                      : QStringLiteral("+COPS: 0"));
        return ok;
    }
    if (command.is("+COPS", Command::Set)) {
        const QString mode = command.argument(0);
        if (mode == QLatin1String("3"))
            m_numericOperator = command.argument(1) == QLatin1String("2");
        return ok;
    }
    if (command.is("+COPS", Command::Test)) {
        lines << QStringLiteral("+COPS: (%1,\"%2\",\"%2\",\"%3\",7),,(0-4),(0,2)")
                     .arg(isRegistered ? 2 : 1)
                     .arg(m_sim.provider, m_sim.imsi.left(5));
        return ok;
    }
    if (command.is("+CSQ", Command::Execute)) {
        lines << QStringLiteral("+CSQ: 25,99");
        return ok;
    }
    if (command.is("+CGATT", Command::Query)) {
        lines << QStringLiteral("+CGATT: %1").arg(int(isRegistered));
        return ok;
    }
    if (command.is("+CGATT", Command::Set))
        return isRegistered || command.argument(0) == QLatin1String("0") ? ok : noService;
    if (command.is("+CGDCONT", Command::Test)) {
        lines << QStringLiteral("+CGDCONT: (1-4),\"IP\",,,(0-2),(0-4)");
        return ok;
    }
    return QString();
}

QString AtModem::performRegistration(const Command &command, int &reporting, QStringList &lines) const
{
    if (command.kind == Command::Test)
        lines << command.name + QStringLiteral(": (0-2)");
    else if (command.kind == Command::Set)
        reporting = command.argument(0).toInt();
    else if (command.kind == Command::Query)
        lines << registrationLine(command.name, reporting, true);
    return ok;
}

QString AtModem::registrationLine(const QString &name, int reporting, bool isQuery) const
{
    QString line = name + QStringLiteral(": ");
    if (isQuery)
        line += QStringLiteral("%1,").arg(reporting);
    line += QString::number(registration());
    const bool isRegistered = registration() == Home || registration() == Roaming;
    if (reporting == 2 && isRegistered)
        line += QStringLiteral(",\"1A2B\",\"00C3D4E%1\",7").arg(m_slot);
    return line;
}

QString AtModem::accessFile(const QStringList &arguments, QStringList &lines) const
{
    if (!m_sim.present)
        return noCard;
    const auto answerOfCard = [&lines](const QString &status, const QByteArray &data = QByteArray()) {
        QString line = QStringLiteral("+CRSM: ") + status;
        if (!data.isEmpty())
            line += QStringLiteral(",\"%1\"").arg(QString::fromLatin1(data.toHex().toUpper()));
        lines << line;
        return ok;
    };
    const int id = arguments.value(1).toInt();
    const auto files = filesOf(m_sim);
    const auto found = files.find(id);
    if (found == files.end())
        return answerOfCard(fileNotFound);
    const SimFile &file = found->second;
    const int first = arguments.value(2).toInt();
    const int second = arguments.value(3).toInt();
    const int length = arguments.value(4).toInt();
    const int access = arguments.value(0).toInt();
    if (access == GetResponse)
        return answerOfCard(done, file.description(id));
    if (lock() != Unlocked && !file.readableWhileLocked)
        return answerOfCard(notPermitted);
    if (access == ReadBinary && file.structure == SimFile::Transparent) {
        const QByteArray &content = file.records.first();
        constexpr int largestByte = 255;
        const auto isByte = [](int number) {
            return number >= 0 && number <= largestByte;
        };
        if (!isByte(first) || !isByte(second) || !isByte(length))
            return answerOfCard(wrongLength);
        const int offset = first << 8 | second;
        if (offset + length > content.size())
            return answerOfCard(wrongLength);
        return answerOfCard(done, content.mid(offset, length));
    }
    if (access == ReadRecord && file.structure == SimFile::LinearFixed) {
        if (first < 1 || first > file.records.size())
            return answerOfCard(recordNotFound);
        const QByteArray &record = file.records.at(first - 1);
        return length == record.size() ? answerOfCard(done, record) : answerOfCard(wrongLength);
    }
    return answerOfCard(unknownCommand);
}

QString AtModem::enterPin(const QStringList &arguments)
{
    if (!m_sim.present)
        return noCard;
    if (lock() == Unlocked)
        return notAllowed;
    const Registration before = registration();
    // A locked-out card wants its PUK, which is any eight digits, and a new PIN.
    constexpr int pukLength = 8;
    const bool isRight = lock() == PukLocked ? arguments.size() == 2 && arguments.first().size() == pukLength
                                             : arguments.value(0) == m_pin;
    if (!isRight) {
        m_attemptsLeft = std::max(m_attemptsLeft - 1, 0);
        if (lock() == PinLocked && m_attemptsLeft == 0) {
            m_sim.pin = pukRequired;
            m_attemptsLeft = pukAttempts;
        }
        return wrongPassword;
    }
    if (lock() == PukLocked)
        m_pin = arguments.at(1);
    m_sim.pin = nothingRequired;
    m_attemptsLeft = pinAttempts;
    // The driver has no way to hear that the card is ready now; it looks again at one that comes anew.
    announceCard(false);
    announceCard(true);
    announceRegistration(before);
    return ok;
}

void AtModem::reset()
{
    m_function = MinimumFunction;
    m_voiceReporting = 0;
    m_dataReporting = 0;
    m_numericOperator = false;
    // Without power the card forgets that it was told its PIN.
    if (m_asksForPin && lock() == Unlocked)
        m_sim.pin = pinRequired;
}

void AtModem::cardChanged()
{
    m_asksForPin = lock() != Unlocked;
    m_attemptsLeft = lock() == PukLocked ? pukAttempts : pinAttempts;
    announceCard(m_sim.present);
}

void AtModem::setNetwork(Registration registration)
{
    const Registration before = this->registration();
    m_network = registration;
    announceRegistration(before);
}

AtModem::Registration AtModem::registration() const
{
    return m_function == FullFunction && m_sim.present && lock() == Unlocked ? m_network : NotRegistered;
}

void AtModem::setFunction(Function function)
{
    const Registration before = registration();
    m_function = function;
    announceRegistration(before);
}

void AtModem::announceCard(bool isPresent)
{
    announce(QStringLiteral("+USIMSTATE: %1").arg(int(isPresent)));
}

void AtModem::announceRegistration(Registration before)
{
    if (registration() == before)
        return;
    if (m_voiceReporting > 0)
        announce(registrationLine(QStringLiteral("+CREG"), m_voiceReporting, false));
    if (m_dataReporting > 0)
        announce(registrationLine(QStringLiteral("+CGREG"), m_dataReporting, false));
}

void AtModem::announce(const QString &line)
{
    if (m_isAnswering)
        m_announcements << line;
    else if (m_announcer)
        m_announcer(line);
}

} // namespace Simulator
} // namespace Corvane
