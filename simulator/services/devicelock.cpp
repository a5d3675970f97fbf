// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "refusal.h"
#include "sandbox.h"
#include "service.h"
#include "userstorage.h"

#include <QtCore/QJsonArray>

#include <algorithm>
#include <array>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName("org.veldmobile.devicelock");
const QLatin1String socketPath("/run/veld-devicelock/socket");
const QLatin1String statePath("/devicelock/state");
const QLatin1String stateInterface("org.veldmobile.devicelock.State");
const QLatin1String managementPath("/mdm");
const QLatin1String managementInterface("org.corvaneos.devicelock.DeviceManagement");

const QLatin1String sideloadingKey("/desktop/veld/devicelock/sideloading_allowed");
constexpr char settingsFolder[] = "/usr/share/dapple/devicelock";
constexpr char settingsFile[] = "/usr/share/dapple/devicelock/devicelock_settings.conf";
constexpr char settingsGroup[] = "desktop";
constexpr char settingsSideloadingKey[] = "veld\\devicelock\\sideloading_allowed";

constexpr int shortestCode = 4;
constexpr int longestCode = 42;
constexpr int defaultAttempts = 5;

// On the wire.
enum State : guint32 { Unlocked = 0, Locked = 1, ManagerLockout = 2, CodeLockout = 3 };
const std::array<QString, 4> stateWords{QStringLiteral("unlocked"), QStringLiteral("locked"),
                                        QStringLiteral("manager-lockout"), QStringLiteral("code-lockout")};
constexpr guint32 restartOption = 1;
constexpr guint32 partitionOption = 2;
constexpr guint32 mediaOption = 4;
constexpr guint32 allOptions = restartOption | partitionOption | mediaOption;

MethodError invalidArguments(const QString &message)
{
    return MethodError(QStringLiteral("org.freedesktop.DBus.Error.InvalidArgs"), message);
}

MethodError accessDenied(const QString &message)
{
    return MethodError(QStringLiteral("org.freedesktop.DBus.Error.AccessDenied"), message);
}

QString codeProblem(const QString &code)
{
    if (code.size() < shortestCode || code.size() > longestCode)
        return QStringLiteral("The code must have %1 to %2 characters").arg(shortestCode).arg(longestCode);
    const bool isPrintable = std::all_of(code.begin(), code.end(),
                                         [](QChar each) { return each.isPrint() || each.isSurrogate(); });
    return isPrintable ? QString() : QStringLiteral("The code must not have control characters");
}

std::string settingsText(bool sideloadingAllowed)
{
    return std::string("[") + settingsGroup + "]\n" + settingsSideloadingKey + "="
        + (sideloadingAllowed ? "1" : "0") + "\n";
}

class DeviceLock : public Component
{
public:
    DeviceLock(const QJsonObject &profile, const QJsonObject &storage, Phone &phone);

    void attach(Service &service) override;
    void detach() override { m_service = nullptr; }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    bool isLockedOut() const { return m_state == ManagerLockout; }
    void setState(State state);
    void setLockoutMode(MethodCall &call);
    void clear(MethodCall &call);
    void setCode(MethodCall &call);
    void changeSetting(MethodCall &call);
    QString lock();
    QString enterCode(const QString &code);
    void writeSideloading(bool allowed) const;

    Phone &m_phone;
    UserStorage m_storage;
    State m_state;
    QString m_code; ///< empty: there is none
    const int m_maximumAttempts;
    int m_attempts = 0; ///< that went wrong since the last right one
    Variant m_feedback; ///< of the manager's lockout
    Service *m_service = nullptr;
};

DeviceLock::DeviceLock(const QJsonObject &profile, const QJsonObject &storage, Phone &phone)
    : m_phone(phone)
    , m_storage(storage)
    , m_state(profile.value(QLatin1String("locked")).toBool() ? Locked : Unlocked)
    , m_code(profile.value(QLatin1String("code")).toString())
    , m_maximumAttempts(profile.value(QLatin1String("attempts")).toInt(defaultAttempts))
{
}

void DeviceLock::attach(Service &service)
{
    m_service = &service;
    service.listenAt(socketPath);
    service.addObject(statePath, stateInterface, {{QStringLiteral("Get"), [this](MethodCall &call) {
                                                       call.reply(g_variant_new("(u)", guint32(m_state)));
                                                   }}});
    service.addObject(managementPath, managementInterface,
                      {
                          {QStringLiteral("SetLockoutMode"),
                           [this](MethodCall &call) {
                               setLockoutMode(call);
                           }},
                          {QStringLiteral("ClearDevice"),
                           [this](MethodCall &call) {
                               clear(call);
                           }},
                          {QStringLiteral("SetSecurityCode"),
                           [this](MethodCall &call) {
                               setCode(call);
                           }},
                          {QStringLiteral("ChangeSetting"),
                           [this](MethodCall &call) {
                               changeSetting(call);
                           }},
                      });
}

void DeviceLock::setState(State state)
{
    if (m_state == state)
        return;
    m_state = state;
    if (m_service)
        m_service->emitSignal(statePath, stateInterface, QStringLiteral("Changed"),
                              g_variant_new("(u)", guint32(state)));
}

void DeviceLock::setLockoutMode(MethodCall &call)
{
    const guint32 mode = call.number(0);
    if (mode > 1)
        throw invalidArguments(QStringLiteral("There is no lockout mode %1").arg(mode));
    if (mode == 1) {
        m_feedback = Variant(g_variant_get_child_value(call.arguments(), 1));
        setState(ManagerLockout);
    } else if (isLockedOut()) {
        m_feedback = Variant();
        setState(m_code.isEmpty() ? Unlocked : Locked);
    }
    call.reply();
}

void DeviceLock::clear(MethodCall &call)
{
    const guint32 options = call.number(0);
    if (options & ~allOptions)
        throw invalidArguments(QStringLiteral("There is no option %1").arg(options & ~allOptions));
    m_storage.eraseUserData();
    if (options & mediaOption)
        m_storage.eraseExternalMedia();
    if (options & partitionOption)
        m_storage.erasePartition();
    m_code.clear();
    m_attempts = 0;
    m_feedback = Variant();
    setState(Unlocked);
    call.reply();
    m_phone.goDown(options & restartOption);
}

void DeviceLock::setCode(MethodCall &call)
{
    const QString code = call.text(0);
    const QString problem = codeProblem(code);
    if (!problem.isEmpty())
        throw invalidArguments(problem);
    m_code = code;
    m_attempts = 0;
    call.reply();
}

void DeviceLock::changeSetting(MethodCall &call)
{
    const QString key = call.text(0);
    if (key != sideloadingKey)
        throw accessDenied(QStringLiteral("There is no setting \"%1\" that could be changed").arg(key));
    const Variant box(g_variant_get_child_value(call.arguments(), 1));
    const Variant value(g_variant_get_variant(box.get()));
    if (!g_variant_is_of_type(value.get(), G_VARIANT_TYPE_BOOLEAN))
        throw invalidArguments(QStringLiteral("The setting \"%1\" is true or false").arg(key));
    writeSideloading(g_variant_get_boolean(value.get()));
    call.reply();
}

void DeviceLock::writeSideloading(bool allowed) const
{
    // Whatever else the file says is kept; one that says nonsense is written anew.
    const std::unique_ptr<GKeyFile, GlibDeleter<g_key_file_free>> file(g_key_file_new());
    g_key_file_load_from_file(file.get(), settingsFile, G_KEY_FILE_KEEP_COMMENTS, nullptr);
    g_key_file_set_integer(file.get(), settingsGroup, settingsSideloadingKey, allowed ? 1 : 0);
    g_mkdir_with_parents(settingsFolder, 0755);
    ErrorSlot error;
    if (!g_key_file_save_to_file(file.get(), settingsFile, &error))
        throw MethodError(QStringLiteral("org.freedesktop.DBus.Error.IOError"),
                          QString::fromUtf8(error->message));
}

QString DeviceLock::lock()
{
    if (m_code.isEmpty())
        throw Refusal(QStringLiteral("The phone has no security code, so it cannot be locked"));
    if (m_state == Unlocked)
        setState(Locked);
    return stateWords.at(m_state);
}

QString DeviceLock::enterCode(const QString &code)
{
    if (m_state == ManagerLockout || m_state == CodeLockout)
        throw Refusal(QStringLiteral("The phone takes no code; it is in %1").arg(stateWords.at(m_state)));
    if (code == m_code) {
        m_attempts = 0;
        setState(Unlocked);
    } else if (++m_attempts >= m_maximumAttempts) {
        setState(CodeLockout);
    }
    return stateWords.at(m_state);
}

void DeviceLock::describe(QJsonObject &state) const
{
    QJsonObject part{
        {QStringLiteral("state"), stateWords.at(m_state)},
        {QStringLiteral("code"), m_code},
        {QStringLiteral("wrongCodes"), m_attempts},
    };
    if (m_feedback) {
        const GCharPointer text(g_variant_print(m_feedback.get(), FALSE));
        part.insert(QStringLiteral("feedback"), QString::fromUtf8(text.get()));
    }
    state.insert(QStringLiteral("deviceLock"), part);
    state.insert(QStringLiteral("storage"), m_storage.describe());
    state.insert(QStringLiteral("power"), m_phone.isOn ? QStringLiteral("on") : QStringLiteral("off"));
    state.insert(QStringLiteral("restarts"), m_phone.restarts);
}

std::vector<Action> DeviceLock::actions()
{
    return {
        {QStringLiteral("lock close"), QString(), QStringLiteral("locks the phone, as its user would"), 0, 0,
         [this](const QStringList &) {
             return lock();
         }},
        {QStringLiteral("lock enter"), QStringLiteral("CODE"),
         QStringLiteral("enters a security code on the locked phone"), 1, 1,
         [this](const QStringList &arguments) {
             return enterCode(arguments.first());
         }},
        {QStringLiteral("power on"), QString(), QStringLiteral("switches a phone on that has shut down"), 0,
         0,
         [this](const QStringList &) {
             if (m_phone.isOn)
                 throw Refusal(QStringLiteral("The phone is on already"));
             m_phone.comeUp();
             return QString();
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    const QJsonObject lock = profile.value(QLatin1String("deviceLock")).toObject();
    const QString code = lock.value(QLatin1String("code")).toString();
    if (!code.isEmpty() && !codeProblem(code).isEmpty())
        return QStringLiteral("/deviceLock/code: ") + codeProblem(code);
    if (code.isEmpty() && lock.value(QLatin1String("locked")).toBool())
        return QStringLiteral("/deviceLock/locked: a phone without a code cannot be locked; must be false");
    return QString();
}

const ComponentRegistration registration({
    serviceName,
    [](const QJsonObject &profile, Phone &phone) {
        return std::make_unique<DeviceLock>(profile.value(QLatin1String("deviceLock")).toObject(),
                                            profile.value(QLatin1String("storage")).toObject(), phone);
    },
    problemOf,
    [](const QJsonObject &profile, PhoneFiles &files) {
        UserStorage::addFiles(profile.value(QLatin1String("storage")).toObject(), files);
        files.files[settingsFile] = settingsText(profile.value(QLatin1String("deviceLock"))
                                                     .toObject()
                                                     .value(QLatin1String("sideloadingAllowed"))
                                                     .toBool());
    },
});

} // namespace

} // namespace Simulator
} // namespace Corvane
