// SPDX-License-Identifier: LGPL-2.1-or-later
#include <mlite/mdesktopentry.h>

#include <keyfile_p.h>

class MDesktopEntry::Private : public KeyFile
{
public:
    using KeyFile::KeyFile;

    QString value(const char *key) const { return text(G_KEY_FILE_DESKTOP_GROUP, key); }
    bool isSet(const char *key) const { return flag(G_KEY_FILE_DESKTOP_GROUP, key); }
};

MDesktopEntry::MDesktopEntry(const QString &fileName)
    : d(new Private(fileName))
{
}

MDesktopEntry::~MDesktopEntry()
{
    delete d;
}

bool MDesktopEntry::isValid() const
{
    const QString type = d->value(G_KEY_FILE_DESKTOP_KEY_TYPE);
    if (type.isEmpty() || nameUnlocalized().isEmpty())
        return false;
    return type != QLatin1String(G_KEY_FILE_DESKTOP_TYPE_APPLICATION)
        || !d->value(G_KEY_FILE_DESKTOP_KEY_EXEC).isEmpty()
        || d->isSet(G_KEY_FILE_DESKTOP_KEY_DBUS_ACTIVATABLE);
}

QString MDesktopEntry::nameUnlocalized() const
{
    return d->value(G_KEY_FILE_DESKTOP_KEY_NAME);
}

QString MDesktopEntry::icon() const
{
    return d->value(G_KEY_FILE_DESKTOP_KEY_ICON);
}

bool MDesktopEntry::noDisplay() const
{
    return d->isSet(G_KEY_FILE_DESKTOP_KEY_NO_DISPLAY);
}

QStringList MDesktopEntry::notShowIn() const
{
    return d->list(G_KEY_FILE_DESKTOP_GROUP, G_KEY_FILE_DESKTOP_KEY_NOT_SHOW_IN);
}
