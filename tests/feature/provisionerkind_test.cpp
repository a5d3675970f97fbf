// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"
#include "signalsequence.h"

#include "accounts/provisioner_p.h"

#include <QtCore/QPointer>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::Accounts::Provisioner;
using Corvane::Mdm::Accounts::ProvisionerPrivate;

namespace
{

/** A kind that leaves to the base whatever it can. */
class PlainKind : public Provisioner
{
public:
    explicit PlainKind(QObject *parent = nullptr)
        : Provisioner(parent)
        , d(new ProvisionerPrivate(this))
    {
        setPrivatePtr(d);
    }

    bool createAccount() override { return d->createAccount(QStringLiteral("createAccount"), {}); }
    QPointer<ProvisionerPrivate> privatePart() const { return d; }

private:
    ProvisionerPrivate *const d;
};

/** A kind that knows when it has all that it needs. */
class ReadyPrivate : public ProvisionerPrivate
{
public:
    using ProvisionerPrivate::ProvisionerPrivate;
    bool canCreateAccount() const override { return providerName == QLatin1String("ready"); }
};

class ReadyKind : public Provisioner
{
public:
    ReadyKind() { setPrivatePtr(new ReadyPrivate(this)); }
    bool createAccount() override { return false; }
};

/** A kind with answers of its own to all that is asked. */
class OwnKind : public PlainKind
{
public:
    bool createAccount() override { return true; }
    bool deleteAccount(quint64 accountId) override { return accountId == 7; }
    QList<AccountInfo> listAccounts() override { return {AccountInfo{}, AccountInfo{}}; }
};

} // namespace

/** What the base of the provisioners gives to a kind of account. */
class ProvisionerKindTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cannotCreateByItself();
    void answerOfTheKindCounts();
    void listsAndDeletesByItself();
    void kindMayDoItAll();
    void privatePartGoesWithIt();
};

void ProvisionerKindTest::cannotCreateByItself()
{
    Phone phone;
    PlainKind kind;
    SignalSequence seen(&kind);
    QVERIFY(!kind.canCreateAccount());
    kind.setProviderName(QStringLiteral("p"));
    QVERIFY(!kind.canCreateAccount());
    QCOMPARE(seen.take(), QStringList(QStringLiteral("providerNameChanged()")));
    QVERIFY(!kind.createAccount());
    QCOMPARE(kind.error(), 1);
    QCOMPARE(kind.errorMessage(), QStringLiteral("One or more required settings have not been provided"));
    phone.settle(QStringLiteral("org.corvaneos.mdmproxy"));
    QCOMPARE(phone.takeJournal(QStringLiteral("org.corvaneos.mdmproxy")), QStringList());
}

void ProvisionerKindTest::answerOfTheKindCounts()
{
    ReadyKind kind;
    SignalSequence seen(&kind);
    const QString named = QStringLiteral("providerNameChanged()");
    const QString changed = QStringLiteral("canCreateAccountChanged()");
    kind.setProviderName(QStringLiteral("other"));
    QCOMPARE(seen.take(), QStringList(named));
    kind.setProviderName(QStringLiteral("ready"));
    QCOMPARE(seen.take(), QStringList({named, changed}));
    QVERIFY(kind.canCreateAccount());
    // The check does not look at these.
    kind.setAccountDisplayName(QStringLiteral("d"));
    kind.setAccountConfiguration({{QStringLiteral("k"), 1}});
    kind.setAccountReadOnly(true);
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("accountDisplayNameChanged()"),
                          QStringLiteral("accountConfigurationChanged()"),
                          QStringLiteral("accountReadOnlyChanged()")}));
    kind.setProviderName(QString());
    QCOMPARE(seen.take(), QStringList({named, changed}));
}

void ProvisionerKindTest::listsAndDeletesByItself()
{
    PlainKind kind;
    QCOMPARE(kind.listAccounts().size(), 1);
    QCOMPARE(kind.error(), 0);
    QVERIFY(!kind.deleteAccount(4711));
    QVERIFY(kind.error() != 0);
    QVERIFY(!kind.errorMessage().isEmpty());
}

void ProvisionerKindTest::kindMayDoItAll()
{
    OwnKind own;
    Provisioner &provisioner = own;
    QVERIFY(provisioner.createAccount());
    QVERIFY(provisioner.deleteAccount(7));
    QVERIFY(!provisioner.deleteAccount(8));
    QCOMPARE(provisioner.listAccounts().size(), 2);
    QCOMPARE(provisioner.error(), 0);
}

void ProvisionerKindTest::privatePartGoesWithIt()
{
    auto kind = std::make_unique<PlainKind>();
    const QPointer<ProvisionerPrivate> privatePart = kind->privatePart();
    QCOMPARE(privatePart->parent(), kind.get());
    kind.reset();
    QVERIFY(!privatePart);
}

QTEST_GUILESS_MAIN(ProvisionerKindTest)
#include "provisionerkind_test.moc"
