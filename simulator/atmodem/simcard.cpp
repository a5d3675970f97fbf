// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simcard.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr int iccidFile = 0x2fe2;
constexpr int numbersFile = 0x6f40;
constexpr int serviceTableFile = 0x6f38;
constexpr int providerNameFile = 0x6f46;
constexpr int administrativeDataFile = 0x6fad;
constexpr int phaseFile = 0x6fae;

constexpr char unused = char(0xff);
constexpr int elementaryFile = 4;

/** Two digits a byte, the first in the lower half; what is left over is filled with ones. */
QByteArray swappedDigits(const QString &digits, int size)
{
    QByteArray bytes(size, unused);
    for (int i = 0; i < std::min(digits.size(), 2 * size); ++i) {
        const int digit = digits.at(i).digitValue();
        const int byte = uchar(bytes.at(i / 2));
        bytes[i / 2] = char(i % 2 == 0 ? (byte & 0xf0) | digit : (byte & 0x0f) | digit << 4);
    }
    return bytes;
}

/** Whether @p character has the same number in the card's default alphabet as in ASCII. */
bool isPlain(QChar character)
{
    static const QLatin1String others(" !\"#%&'()*+,-./:;<=>?");
    const char16_t code = character.unicode();
    return (code >= u'0' && code <= u'9') || (code >= u'A' && code <= u'Z') || (code >= u'a' && code <= u'z')
        || QString(others).contains(character);
}

QByteArray cardText(const QString &text)
{
    if (std::all_of(text.begin(), text.end(), isPlain))
        return text.toLatin1();
    QByteArray bytes(1, char(0x80));
    for (const QChar character : text) {
        bytes.append(char(character.row()));
        bytes.append(char(character.cell()));
    }
    return bytes;
}

QByteArray providerName(const QString &name)
{
    constexpr int standardSize = 17;
    // The first byte: at home show this name alone.
    QByteArray content = QByteArray(1, char(0)) + cardText(name);
    // A longer name makes the file longer than standard, rather than the phone different from its profile.
    if (content.size() < standardSize)
        content.append(QByteArray(standardSize - content.size(), unused));
    return content;
}

/** A record without a name: length, kind of number, digits, and no extensions. */
QByteArray numberRecord(const QString &number)
{
    constexpr int longestNumber = 10; // bytes
    constexpr char international = char(0x91);
    constexpr char unknownKind = char(0x81);
    const bool isInternational = number.startsWith(QLatin1Char('+'));
    const QString digits = isInternational ? number.mid(1) : number;
    const int size = std::min((digits.size() + 1) / 2, longestNumber);
    QByteArray record;
    record.append(char(size + 1));
    record.append(isInternational ? international : unknownKind);
    record.append(swappedDigits(digits, longestNumber));
    record.append(2, unused);
    return record;
}

SimFile transparent(const QByteArray &content, bool readableWhileLocked)
{
    return {SimFile::Transparent, readableWhileLocked, {content}};
}

} // namespace

QByteArray SimFile::description(int id) const
{
    const int recordLength = records.first().size();
    const int size = recordLength * records.size();
    const int bytes[] = {
        0,
        0,
        size >> 8,
        size,
        id >> 8,
        id,
        elementaryFile,
        0, // cyclic files only
        0,
        0,
        0, // who may do what; nobody asks
        1, // valid
        2, // bytes that follow
        structure,
        structure == Transparent ? 0 : recordLength,
    };
    QByteArray description;
    for (const int byte : bytes)
        description.append(char(byte));
    return description;
}

std::map<int, SimFile> filesOf(const Sim &sim)
{
    constexpr int iccidSize = 10;
    const char mncLength = 2;
    SimFile numbers{SimFile::LinearFixed, false, {}};
    for (const QString &number : sim.numbers)
        numbers.records.append(numberRecord(number));
    if (numbers.records.isEmpty())
        numbers.records.append(QByteArray(numberRecord(QString()).size(), unused));

    std::map<int, SimFile> files{
        {iccidFile, transparent(swappedDigits(sim.iccid, iccidSize), true)},
        {administrativeDataFile, transparent(QByteArray(3, 0) + mncLength, true)},
        {phaseFile, transparent(QByteArray(1, 2), true)},
        // Services 9 and 17 (own numbers, provider name) are there and active, two bits each.
        {serviceTableFile, transparent(QByteArray::fromHex("ff0003000300000000"), false)},
        {numbersFile, numbers},
    };
    if (!sim.provider.isEmpty())
        files.emplace(providerNameFile, transparent(providerName(sim.provider), true));
    return files;
}

} // namespace Simulator
} // namespace Corvane
