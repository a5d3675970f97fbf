// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_JSONDOCUMENT_H
#define CORVANE_JSONDOCUMENT_H

#include <QtCore/QByteArray>
#include <QtCore/QJsonObject>
#include <QtCore/QString>

namespace Corvane
{

/** A JSON document as read from a file and checked against a JSON Schema. */
struct JsonDocument {
    QJsonObject object; ///< empty when the document is not valid
    QString error; ///< one line: the file, the JSON path at fault (RFC 6901) and what would be right
    bool isValid() const { return error.isEmpty(); }
};

/**
 * Reads @p fileName ("-": standard input) and checks it against @p schema.
 * A file that cannot be read, is not JSON or does not follow the schema gives a document that is not valid.
 */
JsonDocument readJsonDocument(const QString &fileName, const QByteArray &schema);

} // namespace Corvane

#endif // CORVANE_JSONDOCUMENT_H
