// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_RANDOM_H
#define CORVANE_TEST_RANDOM_H

#include <QtCore/QByteArray>
#include <QtCore/QtGlobal>

/**
 * Numbers that are the same in every run and on every machine (SplitMix64).
 *
 * It is cheap to make: whatever is drawn for one purpose has a generator of its own, so that it does not
 * depend on how much was drawn for others before.
 */
class Random
{
public:
    explicit Random(quint64 seed)
        : m_state(seed)
    {
    }
    /** The generator for @p purpose, one of many that @p seed is for. */
    Random(quint64 seed, quint64 number, const QByteArray &purpose)
        : m_state(seed)
    {
        m_state = next() ^ number;
        m_state = next();
        for (const char byte : purpose)
            m_state = m_state * 1099511628211U + uchar(byte);
        next();
    }

    quint64 next()
    {
        m_state += 0x9e3779b97f4a7c15U;
        quint64 mixed = m_state;
        mixed = (mixed ^ (mixed >> 30)) * 0xbf58476d1ce4e5b9U;
        mixed = (mixed ^ (mixed >> 27)) * 0x94d049bb133111ebU;
        return mixed ^ (mixed >> 31);
    }
    /** From 0 to @p count - 1. */
    int below(int count) { return int(next() % quint64(count)); }
    bool chance(int percent) { return below(100) < percent; }
    /** An element of a container that is not empty. */
    template <typename Container> auto pick(const Container &container) -> decltype(container[0])
    {
        return container[below(int(std::size(container)))];
    }

private:
    quint64 m_state;
};

#endif // CORVANE_TEST_RANDOM_H
