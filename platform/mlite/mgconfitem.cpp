// SPDX-License-Identifier: LGPL-2.1-or-later
#include <mlite/mgconfitem.h>

#include <QtCore/QDebug>
#include <QtCore/QMetaMethod>
#include <QtCore/QStringList>

#include <dconf.h>

#include <memory>

namespace
{

/** Lets a std::unique_ptr hold what GLib counts. */
struct Unreference {
    void operator()(GVariant *value) const { g_variant_unref(value); }
    void operator()(DConfClient *client) const { g_object_unref(client); }
};
using Value = std::unique_ptr<GVariant, Unreference>;
using Client = std::unique_ptr<DConfClient, Unreference>;

QStringList toStringList(GVariant *value)
{
    QStringList list;
    GVariantIter iterator;
    g_variant_iter_init(&iterator, value);
    const gchar *text = nullptr;
    while (g_variant_iter_next(&iterator, "&s", &text))
        list.append(QString::fromUtf8(text));
    return list;
}

QVariant toVariant(GVariant *value)
{
    switch (g_variant_classify(value)) {
    case G_VARIANT_CLASS_BOOLEAN:
        return bool(g_variant_get_boolean(value));
    case G_VARIANT_CLASS_BYTE:
        return uint(g_variant_get_byte(value));
    case G_VARIANT_CLASS_INT16:
        return int(g_variant_get_int16(value));
    case G_VARIANT_CLASS_UINT16:
        return uint(g_variant_get_uint16(value));
    case G_VARIANT_CLASS_INT32:
        return int(g_variant_get_int32(value));
    case G_VARIANT_CLASS_UINT32:
        return uint(g_variant_get_uint32(value));
    case G_VARIANT_CLASS_INT64:
        return qlonglong(g_variant_get_int64(value));
    case G_VARIANT_CLASS_UINT64:
        return qulonglong(g_variant_get_uint64(value));
    case G_VARIANT_CLASS_DOUBLE:
        return g_variant_get_double(value);
    case G_VARIANT_CLASS_STRING:
    case G_VARIANT_CLASS_OBJECT_PATH:
    case G_VARIANT_CLASS_SIGNATURE:
        return QString::fromUtf8(g_variant_get_string(value, nullptr));
    case G_VARIANT_CLASS_ARRAY:
        if (g_variant_is_of_type(value, G_VARIANT_TYPE_STRING_ARRAY))
            return toStringList(value);
        return QVariant();
    case G_VARIANT_CLASS_VARIANT:
        return toVariant(Value(g_variant_get_variant(value)).get());
    default:
        return QVariant();
    }
}

/** A floating reference; null when the store has no type for @p value. */
GVariant *toGVariant(const QVariant &value)
{
    switch (value.userType()) {
    case QMetaType::Bool:
        return g_variant_new_boolean(value.toBool());
    case QMetaType::Int:
        return g_variant_new_int32(value.toInt());
    case QMetaType::UInt:
        return g_variant_new_uint32(value.toUInt());
    case QMetaType::LongLong:
        return g_variant_new_int64(value.toLongLong());
    case QMetaType::ULongLong:
        return g_variant_new_uint64(value.toULongLong());
    case QMetaType::Double:
        return g_variant_new_double(value.toDouble());
    case QMetaType::QString:
        return g_variant_new_string(value.toString().toUtf8().constData());
    case QMetaType::QStringList: {
        GVariantBuilder list;
        g_variant_builder_init(&list, G_VARIANT_TYPE_STRING_ARRAY);
        const QStringList texts = value.toStringList();
        for (const QString &text : texts)
            g_variant_builder_add(&list, "s", text.toUtf8().constData());
        return g_variant_builder_end(&list);
    }
    default:
        return nullptr;
    }
}

} // namespace

class MGConfItem::Private
{
public:
    Private(MGConfItem *item, const QString &path)
        : q(item)
        , key(path)
        , rawKey(path.toUtf8())
        , client(dconf_is_key(rawKey.constData(), nullptr) ? dconf_client_new() : nullptr)
    {
        if (client)
            handler = g_signal_connect(client.get(), "changed", G_CALLBACK(&Private::changed), this);
    }

    ~Private()
    {
        if (!client)
            return;
        g_signal_handler_disconnect(client.get(), handler);
        if (watched)
            dconf_client_unwatch_fast(client.get(), rawKey.constData());
    }

    Q_DISABLE_COPY(Private)

    void watch()
    {
        if (!client || watched)
            return;
        watched = true;
        dconf_client_watch_fast(client.get(), rawKey.constData());
    }

    void write(GVariant *value)
    {
        if (!client) {
            qWarning() << "No key of the configuration store:" << key;
            if (value)
                g_variant_unref(g_variant_ref_sink(value));
            return;
        }
        GError *error = nullptr;
        dconf_client_write_fast(client.get(), rawKey.constData(), value, &error);
        if (error) {
            qWarning() << "Cannot change the setting" << key << error->message;
            g_error_free(error);
        }
    }

    MGConfItem *const q;
    const QString key;
    const QByteArray rawKey;
    const Client client; // null without a usable key

private:
    // The paths of a change are relative to its prefix, which is the key itself when only that has changed.
    static void changed(DConfClient *, const gchar *prefix, const gchar *const *changes, const gchar *,
                        gpointer data)
    {
        const auto *self = static_cast<const Private *>(data);
        for (const gchar *const *change = changes; *change; ++change) {
            const QByteArray path = QByteArray(prefix) + *change;
            if (path == self->rawKey || (path.endsWith('/') && self->rawKey.startsWith(path))) {
                Q_EMIT self->q->valueChanged();
                return;
            }
        }
    }

    gulong handler = 0;
    bool watched = false;
};

MGConfItem::MGConfItem(const QString &key, QObject *parent)
    : QObject(parent)
    , d(new Private(this, key))
{
}

MGConfItem::~MGConfItem()
{
    delete d;
}

QString MGConfItem::key() const
{
    return d->key;
}

QVariant MGConfItem::value() const
{
    if (!d->client)
        return QVariant();
    const Value stored(dconf_client_read(d->client.get(), d->rawKey.constData()));
    return stored ? toVariant(stored.get()) : QVariant();
}

QVariant MGConfItem::value(const QVariant &defaultValue) const
{
    const QVariant present = value();
    return present.isValid() ? present : defaultValue;
}

void MGConfItem::set(const QVariant &value)
{
    GVariant *stored = toGVariant(value);
    if (stored)
        d->write(stored);
    else
        qWarning() << "No value for the configuration store:" << value;
}

void MGConfItem::unset()
{
    d->write(nullptr);
}

void MGConfItem::connectNotify(const QMetaMethod &signal)
{
    // Only now, so that who just reads needs no session bus.
    if (signal == QMetaMethod::fromSignal(&MGConfItem::valueChanged))
        d->watch();
}
