// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETPROXY_P_H
#define CORVANEMDM_NETPROXY_P_H

#include <corvanemdm/netproxy.h>

#include <QtDBus/QDBusVariant>

class QDBusPendingCallWatcher;

namespace Corvane
{
namespace Mdm
{

class NetProxyGlobal;
class NetProxyInterface;
class NetProxyService;

/** Decides on validity and selection. A receiver of the signals may delete it at any of them. */
class NetProxyPrivate : public QObject
{
    Q_OBJECT

public:
    /** What of a configuration changed. */
    enum ConfigChange : quint32 { ChangeType = 2, ChangeServers = 4, ChangeExcludes = 8, ChangeUrl = 16 };

    enum Selection { SelectedNone = 0, SelectedService = 1, SelectedGlobal = 2 };

    explicit NetProxyPrivate(NetProxy *netProxy);
    ~NetProxyPrivate() override;

    /** The last component of the object path of a network. */
    static QString pathToIdentifier(const QString &path);
    static QString identifierToPath(const QString &identifier);

    void setValidService(bool isValid);
    void setValidGlobalActive(bool isValid);
    void setValidGlobalConfig(bool isValid);

    bool selectProxy(const QString &identifier);
    bool selectServiceProxy(const QString &identifier);
    void selectGlobalProxy();
    void unselectProxy();

    /** Signals what the @p changes (of ConfigChange) of the configuration of @p changed are. */
    void announce(const NetProxyInterface &changed, quint32 changes);

    // Of the selected network.
    void servicePropertiesReady();
    void propagateProxyConfigChanged();
    void serviceDestroyed();

    NetProxy *const q;
    bool valid = false;
    bool validService = false; ///< the connection manager can be used
    bool validGlobalActive = false; ///< "Active" has been read
    bool validGlobalConfig = false; ///< "Configuration" has been read
    bool serviceConfigReady = true; ///< changes of the selected network may be announced
    Selection selection = SelectedNone;
    NetProxyService *service = nullptr;
    NetProxyGlobal *global = nullptr;
    NetProxyInterface *current = nullptr; ///< one of the two, or none

public Q_SLOTS:
    void onGetPropertyFinishedActive(QDBusPendingCallWatcher *watcher);
    void onGetPropertyFinishedConfiguration(QDBusPendingCallWatcher *watcher);
    void onPropertyChanged(const QString &name, const QDBusVariant &value);

private:
    void setFlag(bool *flag, bool isValid);
    void setValid(bool isValid);
    void activeChanged(bool isActive);
    void configurationChanged(const QVariant &value);
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXY_P_H
