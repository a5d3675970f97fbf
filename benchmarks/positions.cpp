// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/locationinfo.h>

#include <benchmark/benchmark.h>

#include <QtCore/QDateTime>
#include <QtCore/QEventLoop>
#include <QtCore/QStringList>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusVariant>

using Corvane::Mdm::LocationInfo;

namespace
{

const QLatin1String Proxy("org.corvaneos.mdmproxy");
const QLatin1String Path("/Corvane/Mdm/Proxy/LocationInfo");
const QLatin1String Interface("org.corvaneos.mdmproxy.locationinfo");

/** The least that a program does that wants the positions. */
class HandWrittenClient : public QObject
{
    Q_OBJECT

public:
    HandWrittenClient()
    {
        QDBusConnection::systemBus().connect(Proxy, Path, Interface, QStringLiteral("positionChanged"), this,
                                             SLOT(readPosition(QString)));
    }
    void startUpdates() { }
    double latitude() const { return m_latitude; }

Q_SIGNALS:
    void positionChanged();

private Q_SLOTS:
    void readPosition(const QString &text)
    {
        const QStringList fields = text.split(QLatin1Char(';'));
        m_latitude = fields.at(0).toDouble();
        m_longitude = fields.at(1).toDouble();
        m_altitude = fields.at(2).toDouble();
        m_time = QDateTime::fromMSecsSinceEpoch(fields.at(3).toLongLong(), Qt::UTC);
        Q_EMIT positionChanged();
    }

private:
    double m_latitude = 0;
    double m_longitude = 0;
    double m_altitude = 0;
    QDateTime m_time;
};

QDBusMessage report()
{
    qDBusRegisterMetaType<QList<QDBusVariant>>();
    QDBusMessage emission = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
        QStringLiteral("org.corvaneos.simulator.Control"), QStringLiteral("EmitSignal"));
    const QList<QDBusVariant> position{QDBusVariant(QStringLiteral("60.167488;24.951747;3.2;1772467385123"))};
    emission.setArguments({QString(Proxy), QString(Path), QString(Interface),
                           QStringLiteral("positionChanged"), QVariant::fromValue(position)});
    return emission;
}

/** From the proxy's signals to the object's. */
template <typename Client> void follow(benchmark::State &state)
{
    const int count = int(state.range(0));
    const QDBusMessage emission = report();
    const QDBusConnection bus = QDBusConnection::systemBus();
    Client client;
    client.startUpdates();
    QEventLoop loop;
    int seen = 0;
    QObject::connect(&client, &Client::positionChanged, &loop, [&] {
        benchmark::DoNotOptimize(client.latitude());
        if (++seen == count)
            loop.quit();
    });
    for (auto _ : state) {
        seen = 0;
        for (int i = 0; i < count; ++i)
            bus.send(emission);
        loop.exec();
    }
    state.SetItemsProcessed(state.iterations() * count);
}

} // namespace

BENCHMARK_TEMPLATE(follow, LocationInfo)
    ->Name("positions/library")
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond)
    ->UseRealTime();
BENCHMARK_TEMPLATE(follow, HandWrittenClient)
    ->Name("positions/QtDBus")
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond)
    ->UseRealTime();

#include "positions.moc"
