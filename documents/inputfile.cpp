// SPDX-License-Identifier: LGPL-2.1-or-later
#include "inputfile.h"

#include <QtCore/QFile>

#include <cstdio>

namespace Corvane
{

namespace
{

const QLatin1String standardInput("-");

QString sizeText(qint64 bytes)
{
    constexpr qint64 mebi = 1024 * 1024;
    return bytes % mebi == 0 ? QStringLiteral("%1 MiB").arg(bytes / mebi)
                             : QStringLiteral("%1 bytes").arg(bytes);
}

} // namespace

QString inputFileName(const QString &fileName)
{
    return fileName == standardInput ? QStringLiteral("standard input") : fileName;
}

InputFile readInputFile(const QString &fileName, qint64 largest)
{
    InputFile input{inputFileName(fileName), {}, {}};
    QFile file(fileName);
    const bool opened
        = fileName == standardInput ? file.open(stdin, QIODevice::ReadOnly) : file.open(QIODevice::ReadOnly);
    if (opened)
        input.content = file.read(largest + 1);
    // A folder can be opened, but not read.
    if (!opened || (input.content.isEmpty() && file.error() != QFileDevice::NoError))
        input.error = QStringLiteral("cannot be read: %1").arg(file.errorString());
    else if (input.content.size() > largest)
        input.error = QStringLiteral("is too large, must be at most %1").arg(sizeText(largest));
    return input;
}

} // namespace Corvane
