// SPDX-License-Identifier: LGPL-2.1-or-later
#include <jsondocument.h>

#include <QtCore/QTemporaryDir>
#include <QtTest/QTest>

using Corvane::JsonDocument;
using Corvane::readJsonDocument;

class JsonDocumentTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void acceptsWhatFollowsTheSchema();
    void namesTheFileThatCannotBeRead();
    void namesThePlaceOfASyntaxError_data();
    void namesThePlaceOfASyntaxError();
    void namesThePathOfAViolation_data();
    void namesThePathOfAViolation();
    void fallsBackOnTheValidatorsWords();

private:
    QString write(const QByteArray &text);
    JsonDocument read(const QByteArray &text);

    QTemporaryDir m_folder;
};

static const QByteArray schema = R"({
    "type": "object",
    "required": ["name"],
    "additionalProperties": false,
    "properties": {
        "name": {"type": "string", "minLength": 1},
        "level": {"type": "integer", "minimum": 0, "maximum": 100},
        "alias": {"type": ["string", "null"]},
        "version": {"const": 1},
        "a/b~c": {"type": "boolean"},
        "tags": {"type": "array", "uniqueItems": true, "items": {"type": "string"}},
        "sims": {"type": "array", "maxItems": 2, "items": {"$ref": "#/definitions/sim"}},
        "extra": {"type": "object", "additionalProperties": {"type": "number", "exclusiveMinimum": 0}},
        "limited": {"not": {"type": "string"}}
    },
    "definitions": {
        "sim": {
            "type": "object",
            "required": ["imsi"],
            "additionalProperties": false,
            "properties": {
                "imsi": {"type": "string", "pattern": "^[0-9]+$", "description": "digits only"},
                "action": {"enum": ["block", "allow"]}
            }
        }
    }
})";

QString JsonDocumentTest::write(const QByteArray &text)
{
    const QString name = m_folder.filePath(QStringLiteral("document.json"));
    QFile file(name);
    if (!file.open(QIODevice::WriteOnly) || file.write(text) != text.size())
        qFatal("cannot write the document");
    return name;
}

JsonDocument JsonDocumentTest::read(const QByteArray &text)
{
    JsonDocument document = readJsonDocument(write(text), schema);
    document.error.replace(m_folder.filePath(QStringLiteral("document.json")), QStringLiteral("FILE"));
    return document;
}

void JsonDocumentTest::acceptsWhatFollowsTheSchema()
{
    const JsonDocument document = read(
        R"({"name": "a", "sims": [{"imsi": "244"}], "alias": null, "extra": {"x": 1.5}, "a/b~c": true})");
    QCOMPARE(document.error, QString());
    QVERIFY(document.isValid());
    QCOMPARE(document.object.value(QLatin1String("name")).toString(), QStringLiteral("a"));
}

void JsonDocumentTest::namesTheFileThatCannotBeRead()
{
    const QString missing = m_folder.filePath(QStringLiteral("missing.json"));
    QCOMPARE(readJsonDocument(missing, schema).error,
             missing + QStringLiteral(": cannot be read: No such file or directory"));
    const JsonDocument folder = readJsonDocument(m_folder.path(), schema);
    QVERIFY2(folder.error.startsWith(m_folder.path() + QStringLiteral(": cannot be read: ")),
             qPrintable(folder.error));
    QVERIFY(folder.object.isEmpty());
}

void JsonDocumentTest::namesThePlaceOfASyntaxError_data()
{
    QTest::addColumn<QByteArray>("text");
    QTest::addColumn<QString>("error");

    QTest::newRow("empty") << QByteArray(" \n") << "FILE: is empty, must be a JSON object";
    QTest::newRow("array") << QByteArray("[]") << "FILE: must be a JSON object, is an array";
    QTest::newRow("missing value") << QByteArray("{\n  \"name\": ,\n}") << "FILE:2:11: illegal value";
    QTest::newRow("after other scripts")
        << QByteArray("{\"\xc3\xa4\xc3\xb6\": ,}") << "FILE:1:8: illegal value";
    QTest::newRow("unterminated") << QByteArray("{\"name\": [1, 2 ") << "FILE:1:15: unterminated array";
}

void JsonDocumentTest::namesThePlaceOfASyntaxError()
{
    QFETCH(QByteArray, text);
    QFETCH(QString, error);
    const JsonDocument document = read(text);
    QCOMPARE(document.error, error);
    QVERIFY(!document.isValid());
    QVERIFY(document.object.isEmpty());
}

void JsonDocumentTest::namesThePathOfAViolation_data()
{
    QTest::addColumn<QByteArray>("text");
    QTest::addColumn<QString>("error");

    QTest::newRow("unknown member at the top")
        << QByteArray(R"({"name": "a", "nam": "b"})")
        << R"(FILE: /nam: unknown member; must be one of "a/b~c", "alias", "extra", "level", "limited", "name", "sims", "tags", "version")";
    QTest::newRow("unknown member")
        << QByteArray(R"({"name": "a", "sims": [{"imsi": "1"}, {"imsl": "1"}]})")
        << R"(FILE: /sims/1/imsl: unknown member; must be one of "action", "imsi")";
    QTest::newRow("missing member at the top") << QByteArray("{}") << R"(FILE: must have a member "name")";
    QTest::newRow("missing member") << QByteArray(R"({"name": "a", "sims": [{"action": "block"}]})")
                                    << R"(FILE: /sims/0: must have a member "imsi")";
    QTest::newRow("choice") << QByteArray(R"({"name": "a", "sims": [{"imsi": "1", "action": "blok"}]})")
                            << R"(FILE: /sims/0/action: must be one of "block", "allow"; is "blok")";
    QTest::newRow("constant") << QByteArray(R"({"name": "a", "version": 2})")
                              << "FILE: /version: must be 1; is 2";
    QTest::newRow("pattern")
        << QByteArray(R"({"name": "a", "sims": [{"imsi": "24x"}]})")
        << R"(FILE: /sims/0/imsi: must be a string of the form ^[0-9]+$ (digits only); is "24x")";
    QTest::newRow("type") << QByteArray(R"({"name": "a", "sims": {}})")
                          << "FILE: /sims: must be an array of at most 2 element(s); is an object";
    QTest::newRow("types") << QByteArray(R"({"name": "a", "alias": 1})")
                           << "FILE: /alias: must be a string or null; is 1";
    QTest::newRow("range") << QByteArray(R"({"name": "a", "level": 101})")
                           << "FILE: /level: must be an integer of at least 0 and at most 100; is 101";
    QTest::newRow("fraction") << QByteArray(R"({"name": "a", "level": 1.5})")
                              << "FILE: /level: must be an integer of at least 0 and at most 100; is 1.5";
    QTest::newRow("length") << QByteArray(R"({"name": ""})")
                            << R"(FILE: /name: must be a string of at least 1 character(s); is "")";
    QTest::newRow("repeated element") << QByteArray(R"({"name": "a", "tags": ["x", "x"]})")
                                      << "FILE: /tags: must be an array without repetitions";
    QTest::newRow("any member") << QByteArray(R"({"name": "a", "extra": {"x": 0}})")
                                << "FILE: /extra/x: must be a number of more than 0; is 0";
    QTest::newRow("escaped path") << QByteArray(R"({"name": "a", "a/b~c": 1})")
                                  << "FILE: /a~1b~0c: must be a boolean; is 1";
}

void JsonDocumentTest::namesThePathOfAViolation()
{
    QFETCH(QByteArray, text);
    QFETCH(QString, error);
    const JsonDocument document = read(text);
    QCOMPARE(document.error, error);
    QVERIFY(document.object.isEmpty());
}

void JsonDocumentTest::fallsBackOnTheValidatorsWords()
{
    const JsonDocument document = read(R"({"name": "a", "limited": "x"})");
    QVERIFY2(document.error.startsWith(QStringLiteral("FILE: /limited: ")), qPrintable(document.error));
    QVERIFY(document.error.size() > int(qstrlen("FILE: /limited: ")));
}

QTEST_APPLESS_MAIN(JsonDocumentTest)
#include "jsondocument_test.moc"
