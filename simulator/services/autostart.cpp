// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "sandbox.h"
#include "service.h"

#include <QtCore/QDir>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/Autostart");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.autostart");
const QLatin1String applicationsFolder("/usr/share/applications");

// Results as the contract numbers them.
enum Result { Success = 0, InvalidDesktopFile = 2, AlreadyAutostarted = 3 };

using KeyFilePointer = std::unique_ptr<GKeyFile, GlibDeleter<g_key_file_unref>>;

/** The absolute path that @p desktopFile means. */
QString pathOf(const QString &desktopFile)
{
    return QDir::cleanPath(QDir(applicationsFolder).absoluteFilePath(desktopFile));
}

/** The command that the desktop entry at @p path starts; empty when it is not valid. */
QString commandOf(const QString &path)
{
    if (!path.endsWith(QLatin1String(".desktop")) || !QFileInfo(path).isFile())
        return QString();
    const KeyFilePointer file(g_key_file_new());
    const QByteArray fileName = path.toUtf8();
    if (!g_key_file_load_from_file(file.get(), fileName.constData(), G_KEY_FILE_NONE, nullptr))
        return QString();
    const auto text = [&file](const char *key) {
        return QString::fromUtf8(
            GCharPointer(g_key_file_get_string(file.get(), G_KEY_FILE_DESKTOP_GROUP, key, nullptr)).get());
    };
    const bool isHidden = g_key_file_get_boolean(file.get(), G_KEY_FILE_DESKTOP_GROUP,
                                                 G_KEY_FILE_DESKTOP_KEY_HIDDEN, nullptr);
    const bool isApplication
        = text(G_KEY_FILE_DESKTOP_KEY_TYPE) == QLatin1String(G_KEY_FILE_DESKTOP_TYPE_APPLICATION);
    return isApplication && !isHidden ? text(G_KEY_FILE_DESKTOP_KEY_EXEC).trimmed() : QString();
}

GVariant *resultTuple(Result result)
{
    return g_variant_new("(i)", int(result));
}

class Autostart : public Component
{
public:
    explicit Autostart(const QJsonArray &profile);

    void attach(Service &service) override;
    void detach() override { }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    Result add(const QString &path);
    Result remove(const QString &path);
    GVariant *query() const;
    QString startSession() const;

    QStringList m_entries; ///< absolute paths
};

Autostart::Autostart(const QJsonArray &profile)
{
    for (const QJsonValue &entry : profile)
        m_entries << pathOf(entry.toString());
}

void Autostart::attach(Service &service)
{
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("add"),
                           [this](MethodCall &call) {
                               call.reply(resultTuple(add(pathOf(call.text(0)))));
                           }},
                          {QStringLiteral("remove"),
                           [this](MethodCall &call) {
                               call.reply(resultTuple(remove(pathOf(call.text(0)))));
                           }},
                          {QStringLiteral("query"),
                           [this](MethodCall &call) {
                               call.reply(query());
                           }},
                      });
}

Result Autostart::add(const QString &path)
{
    if (commandOf(path).isEmpty())
        return InvalidDesktopFile;
    if (m_entries.contains(path))
        return AlreadyAutostarted;
    m_entries << path;
    return Success;
}

Result Autostart::remove(const QString &path)
{
    return m_entries.removeAll(path) > 0 ? Success : InvalidDesktopFile;
}

GVariant *Autostart::query() const
{
    GVariantBuilder entries;
    g_variant_builder_init(&entries, G_VARIANT_TYPE_STRING_ARRAY);
    for (const QString &entry : m_entries)
        g_variant_builder_add(&entries, "s", entry.toUtf8().constData());
    return g_variant_new("(as)", &entries);
}

QString Autostart::startSession() const
{
    QStringList started;
    for (const QString &entry : m_entries) {
        const QString command = commandOf(entry);
        if (!command.isEmpty())
            started << QStringLiteral("%1: %2").arg(entry, command);
    }
    return started.isEmpty() ? QStringLiteral("Nothing starts with the session")
                             : started.join(QLatin1Char('\n'));
}

void Autostart::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("autostart"), QJsonArray::fromStringList(m_entries));
}

std::vector<Action> Autostart::actions()
{
    return {
        {QStringLiteral("session start"), QString(),
         QStringLiteral("tells what starts with the user session now, and by which command"), 0, 0,
         [this](const QStringList &) {
             return startSession();
         }},
    };
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<Autostart>(profile.value(QLatin1String("autostart")).toArray());
    },
    [](const QJsonObject &) { return QString(); },
    [](const QJsonObject &, PhoneFiles &files) {
        files.writableFolders.push_back(applicationsFolder.data());
    },
});

} // namespace

} // namespace Simulator
} // namespace Corvane
