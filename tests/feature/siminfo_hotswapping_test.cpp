// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/siminfo.h>

#include <mlite/mgconfitem.h>

#include <QtTest/QtTest>

using Corvane::Mdm::SimInfo;

/** On a session bus of its own, which the configuration store needs to be written. */
class SimInfoHotSwappingTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void isSupportedUnlessAWarningIsConfigured();
};

void SimInfoHotSwappingTest::isSupportedUnlessAWarningIsConfigured()
{
    const SimInfo info;
    QVERIFY(info.hotSwappingSupported());

    MGConfItem setting(QStringLiteral("/desktop/dapple-tevrik-home/reboot_warning_on_sim_remove"));
    setting.set(true);
    QTRY_VERIFY(!info.hotSwappingSupported());
    setting.set(false);
    QTRY_VERIFY(info.hotSwappingSupported());
    setting.set(true);
    QTRY_VERIFY(!info.hotSwappingSupported());
    setting.unset();
    QTRY_VERIFY(info.hotSwappingSupported());
}

QTEST_GUILESS_MAIN(SimInfoHotSwappingTest)

#include "siminfo_hotswapping_test.moc"
