// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETPROXY_H
#define CORVANEMDM_NETPROXY_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QList>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QUrl>

namespace Corvane
{
namespace Mdm
{

class NetProxyPrivate;

/**
 * @brief Reads and writes the proxies that the phone's traffic goes through.
 *
 * There is a proxy configuration for each saved network and a global one for the whole phone. activeType
 * tells which of the two kinds is in use. All other properties are those of one of the configurations, which
 * selectProxy() chooses; once the object is valid for the first time and nothing has been selected, that is
 * the global one.
 *
 * A setter changes the local copy at once and sends what is complete: a manual configuration needs servers,
 * an automatic one its URL; until then the change stays here. The change signals come when the connection
 * manager confirms, and also when somebody else has changed something. A refusal shows in that nothing is
 * confirmed.
 *
 * Nothing blocks, except that the construction asks the bus for the connection manager.
 *
 * Source: connection manager "net.connman": its networks, and "org.corvaneos.connman.GlobalProxy" at "/".
 */
class CORVANEMDM_EXPORT NetProxy : public QObject
{
    Q_OBJECT
    Q_PROPERTY(bool valid READ isValid NOTIFY validChanged)
    Q_PROPERTY(Corvane::Mdm::NetProxy::ProxyType type READ type WRITE setType NOTIFY typeChanged)
    Q_PROPERTY(
        QList<QUrl> manualProxies READ manualProxies WRITE setManualProxies NOTIFY manualProxiesChanged)
    Q_PROPERTY(QStringList manualExclusions READ manualExclusions WRITE setManualExclusions NOTIFY
                   manualExclusionsChanged)
    Q_PROPERTY(QUrl automaticUrl READ automaticUrl WRITE setAutomaticUrl NOTIFY automaticUrlChanged)
    Q_PROPERTY(Corvane::Mdm::NetProxy::ActiveType activeType READ activeType WRITE setActiveType NOTIFY
                   activeTypeChanged)

public:
    /** How traffic finds its proxy. */
    enum ProxyType : int {
        Invalid = 0, ///< nothing is selected, or nothing is known of it yet
        Direct = 1, ///< no proxy
        Manual = 2, ///< the servers of manualProxies, except for manualExclusions
        Automatic = 3 ///< as the script at automaticUrl says
    };
    Q_ENUM(ProxyType)

    /** Whose configuration is in use. */
    enum ActiveType : int {
        Service = 0, ///< each network's own
        Global = 1 ///< the global one, for all networks
    };
    Q_ENUM(ActiveType)

    explicit NetProxy(QObject *parent = nullptr);
    ~NetProxy() override;

    /** Whether the connection manager is there and the global proxy has been read. */
    bool isValid() const;

    // Of what is selected. Without a selection the getters return empty values, and the setters false.
    ProxyType type() const;
    /** Returns whether this is a change; it is sent in any case. Invalid is refused. */
    bool setType(ProxyType type);
    /** The proxy servers of the type Manual. */
    QList<QUrl> manualProxies() const;
    /** Returns whether this is a change; it is sent in any case when the type is Manual and there are some.
     */
    bool setManualProxies(const QList<QUrl> &proxies);
    /** Hosts, or patterns of them, that the type Manual leaves out. */
    QStringList manualExclusions() const;
    /** Returns whether this is a change; sent as setManualProxies(), together with the servers. */
    bool setManualExclusions(const QStringList &exclusions);
    /** Where the script of the type Automatic is. */
    QUrl automaticUrl() const;
    /** Returns whether this is a change; it is sent in any case when the type is Automatic and there is one.
     */
    bool setAutomaticUrl(const QUrl &url);

    // Of the phone, whatever is selected.
    ActiveType activeType() const;
    /** Returns whether this is a change; activeType() is changed at once. */
    bool setActiveType(ActiveType type);

    /**
     * Selects whose configuration the properties are: an identifier of getIdentifiers(), "global", or empty
     * for none.
     *
     * Returns false when the identifier is none of a saved network, and, for networks, while the object is
     * not valid; then nothing is selected any more. No change signals follow from a selection.
     */
    bool selectProxy(const QString &identifier);
    /** What is selected; empty for nothing. */
    QString getIdentifier() const;
    /** What a person knows it by: the name of the network, or "Global Proxy"; empty for nothing. */
    QString getName() const;
    /**
     * Identifiers of the saved networks of @p technology, such as "wifi" or one of getTechnologies(), in the
     * connection manager's order. For all technologies (empty) and for "global" the list ends with "global".
     */
    QStringList getIdentifiers(const QString &technology) const;
    /** The names of all technologies, in the connection manager's order, and "global". */
    QStringList getTechnologies() const;

Q_SIGNALS:
    void validChanged(bool valid);
    /** The selected configuration has changed, or the global one is selected and activeType was announced. */
    void proxyConfigChanged();
    void typeChanged(ProxyType type);
    void manualProxiesChanged(const QList<QUrl> &proxies);
    /** Follows manualProxiesChanged(). When the exclusions alone have changed, only proxyConfigChanged()
     * tells. */
    void manualExclusionsChanged(const QStringList &exclusions);
    void automaticUrlChanged(const QUrl &url);
    /** It was announced, perhaps as what it has been before. */
    void activeTypeChanged(ActiveType type);

private:
    Q_DISABLE_COPY(NetProxy)
    NetProxyPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXY_H
