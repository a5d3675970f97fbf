// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_KEYFILE_P_H
#define CORVANEMDM_PLATFORM_KEYFILE_P_H

#include <QtCore/QByteArray>
#include <QtCore/QFile>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <glib.h>

#include <memory>

/** A key file as desktop entries and icon themes are: what cannot be read is missing. */
class KeyFile
{
public:
    explicit KeyFile(const QString &fileName)
        : m_file(g_key_file_new())
    {
        g_key_file_load_from_file(m_file.get(), QFile::encodeName(fileName).constData(),
                                  G_KEY_FILE_KEEP_COMMENTS, nullptr);
    }

    QString text(const char *group, const char *key) const
    {
        const std::unique_ptr<gchar, Free> value(g_key_file_get_string(m_file.get(), group, key, nullptr));
        return QString::fromUtf8(value.get());
    }

    bool flag(const char *group, const char *key) const
    {
        return g_key_file_get_boolean(m_file.get(), group, key, nullptr);
    }

    /** A number, or @p missing. */
    int number(const char *group, const char *key, int missing) const
    {
        GError *error = nullptr;
        const int value = g_key_file_get_integer(m_file.get(), group, key, &error);
        if (!error)
            return value;
        g_error_free(error);
        return missing;
    }

    void setText(const char *group, const char *key, const QString &value)
    {
        g_key_file_set_string(m_file.get(), group, key, value.toUtf8().constData());
    }

    /** What is to be written to a file, comments included. */
    QByteArray toData() const
    {
        gsize size = 0;
        const std::unique_ptr<gchar, Free> data(g_key_file_to_data(m_file.get(), &size, nullptr));
        return QByteArray(data.get(), int(size));
    }

    /** The parts of a value that @p separator divides. */
    QStringList list(const char *group, const char *key, char separator = ';') const
    {
        return text(group, key).split(QLatin1Char(separator), Qt::SkipEmptyParts);
    }

private:
    struct Free {
        void operator()(gchar *text) const { g_free(text); }
        void operator()(GKeyFile *file) const { g_key_file_unref(file); }
    };
    std::unique_ptr<GKeyFile, Free> m_file;
};

#endif // CORVANEMDM_PLATFORM_KEYFILE_P_H
