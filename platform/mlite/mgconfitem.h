// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_MLITE_MGCONFITEM_H
#define CORVANEMDM_PLATFORM_MLITE_MGCONFITEM_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariant>

/**
 * One setting of the configuration store, a dconf database.
 *
 * Reading needs no session bus and never waits; writing and following changes go through the store's service
 * on the session bus, and fail without it. Values are booleans, numbers, strings and lists of strings; a
 * value of another type reads as one that is missing.
 */
class CORVANEMDM_PLATFORM_EXPORT MGConfItem : public QObject
{
    Q_OBJECT

public:
    /** @param key as a path: "/desktop/..."; with one that is no path the setting is always missing. */
    explicit MGConfItem(const QString &key, QObject *parent = nullptr);
    ~MGConfItem() override;

    QString key() const;

    /** The present value; invalid when there is none. */
    QVariant value() const;
    /** The present value, or @p defaultValue when there is none. */
    QVariant value(const QVariant &defaultValue) const;

    /** Changes the value; this object reads it at once, others when the service has stored it. */
    void set(const QVariant &value);
    /** Removes the value. */
    void unset();

Q_SIGNALS:
    /** The value changed, through this object or elsewhere; or a change through this object has failed. */
    void valueChanged();

protected:
    void connectNotify(const QMetaMethod &signal) override;

private:
    Q_DISABLE_COPY(MGConfItem)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_MLITE_MGCONFITEM_H
