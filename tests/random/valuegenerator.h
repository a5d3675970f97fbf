// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_VALUEGENERATOR_H
#define CORVANE_TEST_VALUEGENERATOR_H

#include "glibpointers.h"
#include "random.h"

#include <QtCore/QByteArray>
#include <QtCore/QByteArrayList>

#include <map>
#include <vector>

/** Whether values of @p type may hold file descriptors. */
bool mayHoldHandles(const GVariantType *type);

/**
 * Makes values of any D-Bus type: well-formed, and otherwise as odd as they come.
 *
 * Some are made of what it has learned, so that they are taken for what a service says. A handle is always
 * the first file descriptor of its message.
 */
class ValueGenerator
{
public:
    using Variant = Corvane::Simulator::Variant;

    /** Remembers @p value and all that is in it. */
    void learn(GVariant *value);
    void learnWord(const QByteArray &word);
    const QByteArrayList &words() const { return m_words; }

    /** A signature of at most @p count complete types. */
    static QByteArray signature(Random &random, int count);
    /** A string that may be a word it has learned; never with a NUL in it. */
    QByteArray text(Random &random) const;
    QByteArray objectPath(Random &random) const;
    Variant value(const GVariantType *type, Random &random) const;
    /** The arguments of a message of @p signature. */
    Variant arguments(const QByteArray &signature, Random &random) const;
    /** @p value with something in it that is different; of the same type. */
    Variant changed(GVariant *value, Random &random) const;

private:
    struct Draft;

    Variant make(const GVariantType *type, Draft &draft) const;
    Variant makeBasic(const GVariantType *type, Random &random) const;
    Variant makeBox(Draft &draft) const;
    Variant makeArray(const GVariantType *type, Draft &draft) const;
    Variant change(GVariant *value, Draft &draft) const;

    QByteArrayList m_words;
    std::map<QByteArray, std::vector<Variant>> m_learned; ///< by type
};

#endif // CORVANE_TEST_VALUEGENERATOR_H
