// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulechanneltest.h"

#include <corvanemdm/simmobiledatafilter.h>

#include <QtTest/QtTest>

using Corvane::Mdm::SimMobileDataFilter;

class SimMobileDataFilterTest : public RuleChannelTest
{
    Q_OBJECT

public:
    SimMobileDataFilterTest()
        : RuleChannelTest({testedChannel<SimMobileDataFilter>(
            {"/mdm/gprsfilter", "org.corvaneos.ofono.mdm.GprsFilter", "", "", "rules", "defaultAction", false,
             "Invalid mobile data action:", "GetAll() failed:",
             "Corvane::Mdm::SimMobileDataFilter::SimMobileDataFilter(QObject*) Bad interface!"},
            {&SimMobileDataFilter::setDefaultAction, &SimMobileDataFilter::setRules,
             &SimMobileDataFilter::setRule, &SimMobileDataFilter::hasRuleForImsi,
             &SimMobileDataFilter::removeRule, &SimMobileDataFilter::clearRules,
             &SimMobileDataFilter::defaultAction, &SimMobileDataFilter::rules, &SimMobileDataFilter::ready})})
    {
    }
};

QTEST_GUILESS_MAIN(SimMobileDataFilterTest)
#include "simmobiledatafilter_test.moc"
