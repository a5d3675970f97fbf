// SPDX-License-Identifier: LGPL-2.1-or-later
#include "valuegenerator.h"

#include <QtCore/QSet>
#include <QtTest/QtTest>

using Corvane::Simulator::GCharPointer;
using Corvane::Simulator::GObjectPointer;
using Corvane::Simulator::Variant;

namespace
{

constexpr int Tries = 2000;

QByteArray printed(const Variant &value)
{
    const GCharPointer text(g_variant_print(value.get(), true));
    return QByteArray(text.get());
}

QByteArray typeOf(const Variant &value)
{
    return g_variant_get_type_string(value.get());
}

} // namespace

class ValueGeneratorTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void sameSeedSameValues();
    void generatorsForOtherPurposesDiffer();
    void valuesAreOfTheTypeThatWasAskedFor();
    void signaturesHoldEveryType();
    void everyMessageFitsTheWire();
    void changedValuesKeepTheirType();
    void valuesAreMadeOfWhatWasLearned();
    void propertiesKeepNameAndValueTogether();
};

void ValueGeneratorTest::sameSeedSameValues()
{
    const ValueGenerator generator;
    Random first(3, 4, "purpose");
    Random second(3, 4, "purpose");
    for (int i = 0; i < Tries; ++i) {
        const QByteArray signature = ValueGenerator::signature(first, 4);
        QCOMPARE(ValueGenerator::signature(second, 4), signature);
        QCOMPARE(printed(generator.arguments(signature, first)),
                 printed(generator.arguments(signature, second)));
    }
}

void ValueGeneratorTest::generatorsForOtherPurposesDiffer()
{
    QSet<quint64> first;
    for (quint64 seed = 0; seed < 20; ++seed) {
        for (quint64 number = 0; number < 20; ++number) {
            for (const char *purpose : {"", "a", "b", "ab"})
                first.insert(Random(seed, number, purpose).next());
        }
    }
    QCOMPARE(first.size(), 20 * 20 * 4);
}

void ValueGeneratorTest::valuesAreOfTheTypeThatWasAskedFor()
{
    const ValueGenerator generator;
    Random random(1);
    for (int i = 0; i < Tries; ++i) {
        const QByteArray signature = ValueGenerator::signature(random, 4);
        const QByteArray type = '(' + signature + ')';
        QVERIFY2(g_variant_is_signature(signature.constData()), signature.constData());
        QCOMPARE(typeOf(generator.arguments(signature, random)), type);
    }
}

void ValueGeneratorTest::signaturesHoldEveryType()
{
    Random random(1);
    QSet<char> seen;
    for (int i = 0; i < Tries; ++i) {
        for (const char type : ValueGenerator::signature(random, 4))
            seen.insert(type);
    }
    for (const char type : QByteArray("ybnqiuxtdsoghav(){}"))
        QVERIFY2(seen.contains(type), QByteArray(1, type).constData());
}

/** GDBus and the bus refuse what is nested too deeply, and what is too large. */
void ValueGeneratorTest::everyMessageFitsTheWire()
{
    const ValueGenerator generator;
    Random random(1);
    int largest = 0;
    for (int i = 0; i < Tries; ++i) {
        const GObjectPointer<GDBusMessage> message(g_dbus_message_new_signal("/", "a.b", "C"));
        g_dbus_message_set_body(message.get(),
                                generator.arguments(ValueGenerator::signature(random, 4), random).get());
        g_dbus_message_set_serial(message.get(), 1);
        gsize size = 0;
        Corvane::Simulator::ErrorSlot error;
        const GCharPointer blob(reinterpret_cast<gchar *>(
            g_dbus_message_to_blob(message.get(), &size, G_DBUS_CAPABILITY_FLAGS_UNIX_FD_PASSING, &error)));
        QVERIFY2(blob, error ? error->message : "");
        const GObjectPointer<GDBusMessage> read(g_dbus_message_new_from_blob(
            reinterpret_cast<guchar *>(blob.get()), size, G_DBUS_CAPABILITY_FLAGS_UNIX_FD_PASSING, &error));
        QVERIFY2(read, error ? error->message : "");
        largest = qMax(largest, int(size));
    }
    QVERIFY2(largest > 10000 && largest < 4 * 1024 * 1024, QByteArray::number(largest).constData());
}

void ValueGeneratorTest::changedValuesKeepTheirType()
{
    ValueGenerator generator;
    Random random(1);
    const Variant value(g_variant_new_parsed("([('a', <1>), ('b', <['x', 'y']>)], {'k': <(1, true)>}, 7)"));
    int differing = 0;
    for (int i = 0; i < Tries; ++i) {
        const Variant changed = generator.changed(value.get(), random);
        QCOMPARE(typeOf(changed), typeOf(value));
        differing += printed(changed) == printed(value) ? 0 : 1;
    }
    QVERIFY2(differing > Tries * 8 / 10, QByteArray::number(differing).constData());
}

void ValueGeneratorTest::valuesAreMadeOfWhatWasLearned()
{
    ValueGenerator generator;
    generator.learn(
        Variant(g_variant_new_parsed("(objectpath '/learned', 'learned text', {'key': <uint32 77>})")).get());
    generator.learnWord("learned word");
    Random random(1);
    QByteArray all;
    for (int i = 0; i < Tries; ++i)
        all += printed(generator.arguments("osu", random));
    for (const char *learned : {"/learned", "'learned text'", "'key'", "77", "'learned word'"})
        QVERIFY2(all.contains(learned), learned);
}

void ValueGeneratorTest::propertiesKeepNameAndValueTogether()
{
    ValueGenerator generator;
    generator.learn(Variant(g_variant_new_parsed("{'Powered': <true>}")).get());
    Random random(1);
    int together = 0;
    for (int i = 0; i < Tries; ++i)
        together += printed(generator.arguments("sv", random)) == "('Powered', <true>)" ? 1 : 0;
    QVERIFY2(together > Tries / 5, QByteArray::number(together).constData());
}

QTEST_APPLESS_MAIN(ValueGeneratorTest)

#include "valuegenerator_test.moc"
