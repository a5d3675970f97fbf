// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_EMAILACCOUNTPROVISIONER_H
#define CORVANEMDM_EMAILACCOUNTPROVISIONER_H

#include <corvanemdm/provisioner.h>

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

class EmailAccountProvisionerPrivate;

/**
 * @brief Makes e-mail accounts on the phone.
 *
 * An account needs Provisioner::providerName, emailAddress and incomingPassword. Whether the other settings
 * make sense is the proxy's judgement. Provisioner::accountDisplayName and Provisioner::accountConfiguration
 * are not for e-mail accounts.
 */
class CORVANEMDM_EXPORT EmailAccountProvisioner : public Provisioner
{
    Q_OBJECT
    /** The service of the account that is switched on first, as the provider names it. */
    Q_PROPERTY(QString defaultServiceName READ defaultServiceName WRITE setDefaultServiceName NOTIFY
                   defaultServiceNameChanged)
    /** The address. Required. */
    Q_PROPERTY(QString emailAddress READ emailAddress WRITE setEmailAddress NOTIFY emailAddressChanged)
    /** How mail is fetched. */
    Q_PROPERTY(Corvane::Mdm::Accounts::EmailAccountProvisioner::IncomingProtocol incomingProtocol READ
                   incomingProtocol WRITE setIncomingProtocol NOTIFY incomingProtocolChanged)
    /** The user's name at the server that mail is fetched from. */
    Q_PROPERTY(QString incomingUsername READ incomingUsername WRITE setIncomingUsername NOTIFY
                   incomingUsernameChanged)
    /** The password there. Required. Goes to the proxy as it is, and is kept until the object goes. */
    Q_PROPERTY(QString incomingPassword READ incomingPassword WRITE setIncomingPassword NOTIFY
                   incomingPasswordChanged)
    /** The server that mail is fetched from. */
    Q_PROPERTY(
        QString incomingServer READ incomingServer WRITE setIncomingServer NOTIFY incomingServerChanged)
    /** Its port; 0 leaves it to the proxy. */
    Q_PROPERTY(int incomingPort READ incomingPort WRITE setIncomingPort NOTIFY incomingPortChanged)
    /** How the connection to it is encrypted. */
    Q_PROPERTY(Corvane::Mdm::Accounts::EmailAccountProvisioner::ConnectionEncryption
                   incomingConnectionEncryption READ incomingConnectionEncryption WRITE
                       setIncomingConnectionEncryption NOTIFY incomingConnectionEncryptionChanged)
    /** Whether its certificate is accepted when nothing vouches for it. */
    Q_PROPERTY(bool incomingAcceptUntrustedCertificates READ incomingAcceptUntrustedCertificates WRITE
                   setIncomingAcceptUntrustedCertificates NOTIFY incomingAcceptUntrustedCertificatesChanged)
    /** How mail is sent. */
    Q_PROPERTY(Corvane::Mdm::Accounts::EmailAccountProvisioner::OutgoingProtocol outgoingProtocol READ
                   outgoingProtocol WRITE setOutgoingProtocol NOTIFY outgoingProtocolChanged)
    /** The user's name at the server that mail is sent to. */
    Q_PROPERTY(QString outgoingUsername READ outgoingUsername WRITE setOutgoingUsername NOTIFY
                   outgoingUsernameChanged)
    /** The password there. Goes to the proxy as it is, and is kept until the object goes. */
    Q_PROPERTY(QString outgoingPassword READ outgoingPassword WRITE setOutgoingPassword NOTIFY
                   outgoingPasswordChanged)
    /** The server that mail is sent to. */
    Q_PROPERTY(
        QString outgoingServer READ outgoingServer WRITE setOutgoingServer NOTIFY outgoingServerChanged)
    /** Its port; 0 leaves it to the proxy. */
    Q_PROPERTY(int outgoingPort READ outgoingPort WRITE setOutgoingPort NOTIFY outgoingPortChanged)
    /** How the connection to it is encrypted. */
    Q_PROPERTY(Corvane::Mdm::Accounts::EmailAccountProvisioner::ConnectionEncryption
                   outgoingConnectionEncryption READ outgoingConnectionEncryption WRITE
                       setOutgoingConnectionEncryption NOTIFY outgoingConnectionEncryptionChanged)
    /** Whether its certificate is accepted when nothing vouches for it. */
    Q_PROPERTY(bool outgoingAcceptUntrustedCertificates READ outgoingAcceptUntrustedCertificates WRITE
                   setOutgoingAcceptUntrustedCertificates NOTIFY outgoingAcceptUntrustedCertificatesChanged)
    /** How the user is authenticated there. */
    Q_PROPERTY(
        Corvane::Mdm::Accounts::EmailAccountProvisioner::Authentication outgoingAuthentication READ
            outgoingAuthentication WRITE setOutgoingAuthentication NOTIFY outgoingAuthenticationChanged)

public:
    /** Protocols that mail is fetched by. Other numbers are passed on as they are, as with all enums here. */
    enum IncomingProtocol : int {
        NoIncomingProtocol = 0, ///< mail is not fetched
        Imap4 = 1, ///< IMAP4
        Pop3 = 2 ///< POP3
    };
    Q_ENUM(IncomingProtocol)

    /** Protocols that mail is sent by. */
    enum OutgoingProtocol : int {
        NoOutgoingProtocol = 0, ///< mail is not sent
        Smtp = 1 ///< SMTP
    };
    Q_ENUM(OutgoingProtocol)

    /** How a connection to a server is encrypted. */
    enum ConnectionEncryption : int {
        NoEncryption = 0, ///< not at all
        SSL = 1, ///< TLS from the first byte on
        StartTLS = 2 ///< TLS once the server has offered it
    };
    Q_ENUM(ConnectionEncryption)

    /** How the user is authenticated. */
    enum Authentication : int {
        NoAuthentication = 0, ///< not at all
        Login = 1, ///< LOGIN
        Plain = 2, ///< PLAIN
        CramMd5 = 3 ///< CRAM-MD5
    };
    Q_ENUM(Authentication)

    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit EmailAccountProvisioner(QObject *parent = nullptr);
    ~EmailAccountProvisioner() override;

    bool createAccount() override;

    /** @name Settings
     * See the properties of these names.
     * @{
     */
    QString defaultServiceName() const;
    void setDefaultServiceName(const QString &name);
    QString emailAddress() const;
    void setEmailAddress(const QString &address);
    IncomingProtocol incomingProtocol() const;
    void setIncomingProtocol(IncomingProtocol protocol);
    QString incomingUsername() const;
    void setIncomingUsername(const QString &name);
    QString incomingPassword() const;
    void setIncomingPassword(const QString &password);
    QString incomingServer() const;
    void setIncomingServer(const QString &server);
    int incomingPort() const;
    void setIncomingPort(int port);
    ConnectionEncryption incomingConnectionEncryption() const;
    void setIncomingConnectionEncryption(ConnectionEncryption encryption);
    bool incomingAcceptUntrustedCertificates() const;
    void setIncomingAcceptUntrustedCertificates(bool accept);
    OutgoingProtocol outgoingProtocol() const;
    void setOutgoingProtocol(OutgoingProtocol protocol);
    QString outgoingUsername() const;
    void setOutgoingUsername(const QString &name);
    QString outgoingPassword() const;
    void setOutgoingPassword(const QString &password);
    QString outgoingServer() const;
    void setOutgoingServer(const QString &server);
    int outgoingPort() const;
    void setOutgoingPort(int port);
    ConnectionEncryption outgoingConnectionEncryption() const;
    void setOutgoingConnectionEncryption(ConnectionEncryption encryption);
    bool outgoingAcceptUntrustedCertificates() const;
    void setOutgoingAcceptUntrustedCertificates(bool accept);
    Authentication outgoingAuthentication() const;
    void setOutgoingAuthentication(Authentication authentication);
    /** @} */

Q_SIGNALS:
    /** The property defaultServiceName has changed. */
    void defaultServiceNameChanged();
    /** The property emailAddress has changed. */
    void emailAddressChanged();
    /** The property incomingProtocol has changed. */
    void incomingProtocolChanged();
    /** The property incomingUsername has changed. */
    void incomingUsernameChanged();
    /** The property incomingPassword has changed. */
    void incomingPasswordChanged();
    /** The property incomingServer has changed. */
    void incomingServerChanged();
    /** The property incomingPort has changed. */
    void incomingPortChanged();
    /** The property incomingConnectionEncryption has changed. */
    void incomingConnectionEncryptionChanged();
    /** The property incomingAcceptUntrustedCertificates has changed. */
    void incomingAcceptUntrustedCertificatesChanged();
    /** The property outgoingProtocol has changed. */
    void outgoingProtocolChanged();
    /** The property outgoingUsername has changed. */
    void outgoingUsernameChanged();
    /** The property outgoingPassword has changed. */
    void outgoingPasswordChanged();
    /** The property outgoingServer has changed. */
    void outgoingServerChanged();
    /** The property outgoingPort has changed. */
    void outgoingPortChanged();
    /** The property outgoingConnectionEncryption has changed. */
    void outgoingConnectionEncryptionChanged();
    /** The property outgoingAcceptUntrustedCertificates has changed. */
    void outgoingAcceptUntrustedCertificatesChanged();
    /** The property outgoingAuthentication has changed. */
    void outgoingAuthenticationChanged();

private:
    Q_DISABLE_COPY(EmailAccountProvisioner)
    EmailAccountProvisionerPrivate *const d;
};

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_EMAILACCOUNTPROVISIONER_H
