// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_INPUTFILE_H
#define CORVANE_INPUTFILE_H

#include <QtCore/QByteArray>
#include <QtCore/QString>

namespace Corvane
{

/** What a file holds, or why it could not be read. */
struct InputFile {
    QString name; ///< as people know it
    QByteArray content;
    QString error; ///< without the name; empty when the file was read
};

/** Reads @p fileName, "-" being standard input, as far as it has no more than @p largest bytes. */
InputFile readInputFile(const QString &fileName, qint64 largest);

/** How to call @p fileName in a message. */
QString inputFileName(const QString &fileName);

} // namespace Corvane

#endif // CORVANE_INPUTFILE_H
