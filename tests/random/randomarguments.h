// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_RANDOMARGUMENTS_H
#define CORVANE_TEST_RANDOMARGUMENTS_H

#include "random.h"

#include <QtCore/QDateTime>
#include <QtCore/QFlags>
#include <QtCore/QList>
#include <QtCore/QMap>
#include <QtCore/QStringList>
#include <QtCore/QUrl>
#include <QtCore/QVariant>

#include <type_traits>

/** Makes the arguments of the library's functions. */
struct ArgumentSource {
    Random &random;
    const QStringList &words; ///< what the services speak of
};

/** An argument of type @p T; overloaded or specialised by what it is. */
template <typename T, typename = void> struct RandomArgument;

template <typename T> T randomArgument(ArgumentSource &source)
{
    return RandomArgument<T>::make(source);
}

/** Whether the enumeration @p T can hold any number of its underlying type. */
template <typename T, typename = void> struct HoldsAnyNumber : std::false_type {
};
template <typename T>
struct HoldsAnyNumber<T, std::void_t<decltype(T{std::underlying_type_t<T>(0)})>> : std::true_type {
};

template <> struct RandomArgument<bool> {
    static bool make(ArgumentSource &source) { return source.random.chance(50); }
};

template <typename T>
struct RandomArgument<T, std::enable_if_t<std::is_integral_v<T> && !std::is_same_v<T, bool>>> {
    static T make(ArgumentSource &source)
    {
        return source.random.chance(70) ? T(source.random.below(12) - 2) : T(source.random.next());
    }
};

template <typename T> struct RandomArgument<T, std::enable_if_t<std::is_floating_point_v<T>>> {
    static T make(ArgumentSource &source) { return T(qint64(source.random.next())) / T(1000); }
};

template <typename T> struct RandomArgument<T, std::enable_if_t<std::is_enum_v<T>>> {
    static T make(ArgumentSource &source)
    {
        // Two is a number that any enumeration with three values can hold.
        if (!HoldsAnyNumber<T>::value)
            return T(source.random.below(2));
        return T(randomArgument<int>(source));
    }
};

template <typename T> struct RandomArgument<QFlags<T>> {
    static QFlags<T> make(ArgumentSource &source)
    {
        return QFlags<T>(
            QFlag(source.random.chance(70) ? source.random.below(512) : int(source.random.next())));
    }
};

template <> struct RandomArgument<QString> {
    static QString make(ArgumentSource &source)
    {
        switch (source.random.below(6)) {
        case 0:
            return QString();
        case 1: {
            QString digits;
            for (int left = source.random.below(17); left > 0; --left)
                digits.append(QLatin1Char(char('0' + source.random.below(10))));
            return digits;
        }
        case 2: {
            // Lone surrogates and NULs among them: what no D-Bus string can hold.
            QString units;
            for (int left = source.random.below(20); left > 0; --left)
                units.append(QChar(ushort(source.random.next())));
            return units;
        }
        default:
            return source.words.isEmpty() ? QStringLiteral("word") : source.random.pick(source.words);
        }
    }
};

template <> struct RandomArgument<QByteArray> {
    static QByteArray make(ArgumentSource &source) { return randomArgument<QString>(source).toUtf8(); }
};

template <> struct RandomArgument<QUrl> {
    static QUrl make(ArgumentSource &source) { return QUrl(randomArgument<QString>(source)); }
};

template <> struct RandomArgument<QDateTime> {
    static QDateTime make(ArgumentSource &source)
    {
        if (source.random.chance(20))
            return QDateTime();
        const auto spec = source.random.chance(50) ? Qt::UTC : Qt::LocalTime;
        return QDateTime::fromMSecsSinceEpoch(qint64(source.random.next() % 4102444800000U), spec);
    }
};

template <> struct RandomArgument<QDate> {
    static QDate make(ArgumentSource &source)
    {
        return QDate(source.random.below(3000), source.random.below(14), source.random.below(33));
    }
};

template <> struct RandomArgument<QTime> {
    static QTime make(ArgumentSource &source)
    {
        return QTime(source.random.below(26), source.random.below(62), source.random.below(62));
    }
};

template <typename List, typename Element> List randomList(ArgumentSource &source)
{
    List list;
    for (int left = source.random.below(4); left > 0; --left)
        list.append(randomArgument<Element>(source));
    return list;
}

template <typename T> struct RandomArgument<QList<T>> {
    static QList<T> make(ArgumentSource &source) { return randomList<QList<T>, T>(source); }
};

template <> struct RandomArgument<QStringList> {
    static QStringList make(ArgumentSource &source) { return randomList<QStringList, QString>(source); }
};

template <> struct RandomArgument<QVariant> {
    static QVariant make(ArgumentSource &source)
    {
        switch (source.random.below(9)) {
        case 0:
            return QVariant();
        case 1:
            return randomArgument<bool>(source);
        case 2:
            return randomArgument<int>(source);
        case 3:
            return randomArgument<uint>(source);
        case 4:
            return randomArgument<double>(source);
        case 5:
            return randomArgument<QStringList>(source);
        case 6:
            return randomList<QVariantList, QVariant>(source);
        default:
            return randomArgument<QString>(source);
        }
    }
};

template <typename T> struct RandomArgument<QMap<QString, T>> {
    static QMap<QString, T> make(ArgumentSource &source)
    {
        QMap<QString, T> map;
        for (int left = source.random.below(4); left > 0; --left)
            map.insert(randomArgument<QString>(source), randomArgument<T>(source));
        return map;
    }
};

#endif // CORVANE_TEST_RANDOMARGUMENTS_H
