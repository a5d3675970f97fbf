// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulechanneltest.h"

#include <corvanemdm/simsmsfilter.h>

#include <QtTest/QtTest>

using Corvane::Mdm::SimSmsFilter;

class SimSmsFilterTest : public RuleChannelTest
{
    Q_OBJECT

public:
    SimSmsFilterTest()
        : RuleChannelTest({testedChannel<SimSmsFilter>(
            {"/mdm/smsfilter/textin", "org.corvaneos.ofono.mdm.SmsFilter", "Text", "text", "textRules",
             "defaultTextAction", false, "Invalid Text SMS action:", "GetAll() failed:",
             "Corvane::Mdm::SimSmsFilter::SimSmsFilter(QObject*) Bad interface!"},
            {&SimSmsFilter::setDefaultTextAction, &SimSmsFilter::setTextRules, &SimSmsFilter::setTextRule,
             &SimSmsFilter::hasTextRuleForImsi, &SimSmsFilter::removeTextRule, &SimSmsFilter::clearTextRules,
             &SimSmsFilter::defaultTextAction, &SimSmsFilter::textRules, &SimSmsFilter::ready})})
    {
    }
};

QTEST_GUILESS_MAIN(SimSmsFilterTest)
#include "simsmsfilter_test.moc"
