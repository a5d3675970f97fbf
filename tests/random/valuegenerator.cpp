// SPDX-License-Identifier: LGPL-2.1-or-later
#include "valuegenerator.h"

#include <QtCore/QString>

#include <cmath>
#include <limits>

using Corvane::Simulator::Variant;

/** What is left to the value that is being made: it must not become so large that the bus refuses it. */
struct ValueGenerator::Draft {
    Random &random;
    int values = 3000;
    int depth = 0; ///< D-Bus ends at 64, of arrays and structures at 32
};

namespace
{

constexpr int deepest = 24;
constexpr int mostLearnedOfAType = 200;

const char basicTypes[] = "ybnqiuxtdsogh";

QByteArray typeText(const GVariantType *type)
{
    return QByteArray(g_variant_type_peek_string(type), int(g_variant_type_get_string_length(type)));
}

/** Any number, more often one at which something may happen. */
quint64 number(Random &random)
{
    static const qint64 remarkable[] = {0,
                                        1,
                                        -1,
                                        2,
                                        3,
                                        4,
                                        5,
                                        100,
                                        255,
                                        1000,
                                        std::numeric_limits<qint16>::max(),
                                        std::numeric_limits<qint32>::max(),
                                        std::numeric_limits<qint32>::min(),
                                        std::numeric_limits<quint32>::max(),
                                        std::numeric_limits<qint64>::max(),
                                        std::numeric_limits<qint64>::min(),
                                        1795046400,
                                        1795046400000};
    return random.chance(75) ? quint64(random.pick(remarkable)) : random.next();
}

double real(Random &random)
{
    static const double remarkable[] = {0.0,
                                        -0.0,
                                        1.5,
                                        -180.0,
                                        90.000001,
                                        std::numeric_limits<double>::infinity(),
                                        -std::numeric_limits<double>::infinity(),
                                        std::numeric_limits<double>::quiet_NaN(),
                                        std::numeric_limits<double>::max(),
                                        std::numeric_limits<double>::denorm_min()};
    return random.chance(75) ? random.pick(remarkable) : double(qint64(random.next())) / 1e6;
}

QByteArray letters(Random &random, const char *alphabet, int most)
{
    QByteArray result;
    const int count = random.below(most) + 1;
    for (int i = 0; i < count; ++i)
        result.append(alphabet[random.below(int(qstrlen(alphabet)))]);
    return result;
}

QByteArray oddText(Random &random)
{
    static const char *const odd[] = {"%s%n%1",
                                      "<node><interface name=\"",
                                      "{\"a\":",
                                      "\xC3\xA4\xE2\x82\xAC",
                                      "\xF0\x9F\x93\xB1",
                                      "\xEF\xBF\xBF",
                                      "\xEF\xBB\xBFx",
                                      "a\nb\rc\td",
                                      "\x01\x7F",
                                      "../../..",
                                      "true",
                                      "-1",
                                      "1e999",
                                      "0x10",
                                      " ",
                                      "\xE2\x80\xAE"
                                      "abc",
                                      "2026-11-21T12:00:00Z",
                                      "/etc/passwd",
                                      "127.0.0.1:8080",
                                      "http://[::1",
                                      "a,b;c|d"};
    return QByteArray(random.pick(odd)).repeated(random.chance(2) ? 5000 : 1);
}

QByteArray completeType(Random &random, int depth)
{
    const int kind = random.below(depth > 0 ? 10 : 5);
    switch (kind) {
    case 5:
    case 6:
        return random.chance(50) ? QByteArray("a{sv}") : 'a' + completeType(random, depth - 1);
    case 7:
        return QByteArray("a{") + basicTypes[random.below(int(sizeof(basicTypes)) - 2)]
            + completeType(random, depth - 1) + '}';
    case 8: {
        QByteArray structure("(");
        for (int left = random.below(4) + 1; left > 0; --left)
            structure += completeType(random, depth - 1);
        return structure + ')';
    }
    case 9:
        return "v";
    default:
        return QByteArray(1, basicTypes[random.below(int(sizeof(basicTypes)) - 1)]);
    }
}

} // namespace

bool mayHoldHandles(const GVariantType *type)
{
    return typeText(type).contains('h') || typeText(type).contains('v');
}

void ValueGenerator::learn(GVariant *value)
{
    std::vector<Variant> &known = m_learned[g_variant_get_type_string(value)];
    if (known.size() < mostLearnedOfAType)
        known.push_back(Variant::shared(value));
    if (g_variant_is_of_type(value, G_VARIANT_TYPE_STRING)
        || g_variant_is_of_type(value, G_VARIANT_TYPE_OBJECT_PATH)) {
        learnWord(g_variant_get_string(value, nullptr));
    }
    if (!g_variant_is_container(value))
        return;
    for (gsize i = 0; i < g_variant_n_children(value); ++i)
        learn(Variant(g_variant_get_child_value(value, i)).get());
}

void ValueGenerator::learnWord(const QByteArray &word)
{
    if (!word.isEmpty() && !m_words.contains(word))
        m_words.append(word);
}

QByteArray ValueGenerator::signature(Random &random, int count)
{
    QByteArray result;
    for (int left = random.below(count + 1); left > 0; --left)
        result += completeType(random, random.below(5));
    return result;
}

QByteArray ValueGenerator::text(Random &random) const
{
    const int kind = random.below(10);
    if (kind < 5 && !m_words.isEmpty())
        return random.pick(m_words);
    if (kind < 6)
        return letters(random, "0123456789", 16);
    if (kind < 7)
        return QByteArray();
    if (kind < 8)
        return letters(random, "abcXYZ019_./:-@ ", 30);
    return oddText(random);
}

QByteArray ValueGenerator::objectPath(Random &random) const
{
    if (random.chance(70)) {
        const QByteArray word = text(random);
        if (g_variant_is_object_path(word.constData()))
            return word;
    }
    return random.chance(20) ? QByteArray("/") : '/' + letters(random, "abcXYZ019_", 12);
}

Variant ValueGenerator::value(const GVariantType *type, Random &random) const
{
    Draft draft{random};
    return make(type, draft);
}

Variant ValueGenerator::arguments(const QByteArray &signature, Random &random) const
{
    // A property that has changed: a name and a value that belong together get further.
    const auto properties = m_learned.find("{sv}");
    if (signature == "sv" && properties != m_learned.end() && random.chance(60)) {
        const Variant &property = random.pick(properties->second);
        const Variant name(g_variant_get_child_value(property.get(), 0));
        const Variant value(g_variant_get_child_value(property.get(), 1));
        GVariant *items[] = {name.get(), random.chance(50) ? value.get() : nullptr};
        const Variant another = items[1] ? Variant() : changed(value.get(), random);
        if (!items[1])
            items[1] = another.get();
        return Variant(g_variant_new_tuple(items, 2));
    }
    return value(G_VARIANT_TYPE(QByteArray('(' + signature + ')').constData()), random);
}

Variant ValueGenerator::changed(GVariant *value, Random &random) const
{
    Draft draft{random};
    return change(value, draft);
}

Variant ValueGenerator::make(const GVariantType *type, Draft &draft) const
{
    --draft.values;
    if (draft.random.chance(30)) {
        const auto known = m_learned.find(typeText(type));
        if (known != m_learned.end())
            return draft.random.pick(known->second);
    }
    if (g_variant_type_is_basic(type))
        return makeBasic(type, draft.random);
    if (g_variant_type_is_variant(type))
        return makeBox(draft);
    if (g_variant_type_is_array(type))
        return makeArray(type, draft);

    ++draft.depth;
    GVariantBuilder builder;
    g_variant_builder_init(&builder, type);
    for (const GVariantType *item = g_variant_type_first(type); item; item = g_variant_type_next(item))
        g_variant_builder_add_value(&builder, make(item, draft).get());
    --draft.depth;
    return Variant(g_variant_builder_end(&builder));
}

Variant ValueGenerator::makeBasic(const GVariantType *type, Random &random) const
{
    switch (*g_variant_type_peek_string(type)) {
    case 'b':
        return Variant(g_variant_new_boolean(random.chance(50)));
    case 'y':
        return Variant(g_variant_new_byte(guint8(number(random))));
    case 'n':
        return Variant(g_variant_new_int16(gint16(number(random))));
    case 'q':
        return Variant(g_variant_new_uint16(guint16(number(random))));
    case 'i':
        return Variant(g_variant_new_int32(gint32(number(random))));
    case 'u':
        return Variant(g_variant_new_uint32(guint32(number(random))));
    case 'x':
        return Variant(g_variant_new_int64(gint64(number(random))));
    case 't':
        return Variant(g_variant_new_uint64(number(random)));
    case 'd':
        return Variant(g_variant_new_double(real(random)));
    case 'o':
        return Variant(g_variant_new_object_path(objectPath(random).constData()));
    case 'g':
        return Variant(g_variant_new_signature(signature(random, 3).constData()));
    case 'h':
        return Variant(g_variant_new_handle(0));
    default:
        return Variant(g_variant_new_string(text(random).constData()));
    }
}

Variant ValueGenerator::makeBox(Draft &draft) const
{
    const bool goesDown = draft.values > 0 && draft.depth < deepest;
    // Now and then a box in a box in a box.
    const QByteArray type = goesDown && draft.random.chance(10)
        ? QByteArray("v")
        : completeType(draft.random, goesDown ? draft.random.below(4) : 0);
    draft.depth += 2;
    const Variant content = make(G_VARIANT_TYPE(type.constData()), draft);
    draft.depth -= 2;
    return Variant(g_variant_new_variant(content.get()));
}

Variant ValueGenerator::makeArray(const GVariantType *type, Draft &draft) const
{
    const GVariantType *element = g_variant_type_element(type);
    int count = draft.random.below(4);
    if (draft.random.chance(2))
        count = g_variant_type_is_basic(element) ? 2000 : 50;
    GVariantBuilder builder;
    g_variant_builder_init(&builder, type);
    ++draft.depth;
    while (count-- > 0 && draft.values > 0 && draft.depth < deepest)
        g_variant_builder_add_value(&builder, make(element, draft).get());
    --draft.depth;
    return Variant(g_variant_builder_end(&builder));
}

Variant ValueGenerator::change(GVariant *value, Draft &draft) const
{
    const GVariantType *type = g_variant_get_type(value);
    const gsize count = g_variant_is_container(value) ? g_variant_n_children(value) : 0;
    if (count == 0 || draft.random.chance(10))
        return make(type, draft);

    const auto chosen = gsize(draft.random.below(int(count)));
    if (g_variant_type_is_variant(type)) {
        const Variant content(g_variant_get_variant(value));
        return Variant(g_variant_new_variant(change(content.get(), draft).get()));
    }
    const bool isArray = g_variant_type_is_array(type);
    const int fate = isArray ? draft.random.below(4) : 3;
    GVariantBuilder builder;
    g_variant_builder_init(&builder, type);
    for (gsize i = 0; i < count; ++i) {
        const Variant child(g_variant_get_child_value(value, i));
        if (i != chosen) {
            g_variant_builder_add_value(&builder, child.get());
            continue;
        }
        // Left out, there twice, with another one before it, or different.
        if (fate == 1 || fate == 2)
            g_variant_builder_add_value(
                &builder, fate == 1 ? child.get() : make(g_variant_type_element(type), draft).get());
        if (fate != 0)
            g_variant_builder_add_value(&builder, (fate == 3 ? change(child.get(), draft) : child).get());
    }
    return Variant(g_variant_builder_end(&builder));
}
