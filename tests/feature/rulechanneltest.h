// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_RULECHANNELTEST_H
#define CORVANE_RULECHANNELTEST_H

#include "phone.h"
#include "texts.h"
#include "wirerule.h"

#include <corvanemdm/simfilter.h>

#include <QtCore/QObject>
#include <QtCore/QVector>

#include <functional>
#include <memory>

using Corvane::Mdm::SimFilter;
using Rule = SimFilter::Rule;
using RuleList = SimFilter::RuleList;

QVariant wire(const char *imsi, quint32 action);
QVariant wire(const QList<WireRule> &rules);
WireRule wireRule(const char *imsi, quint32 action);
Rule rule(const char *imsi, SimFilter::Action action);

/** How one kind of traffic is called, by the service and by the filter. */
struct ChannelNames {
    const char *path;
    const char *interface;
    const char *wireWord; ///< in the service's names, as in "Add@Rule"
    const char *prefix; ///< of the filter's signals about rules
    const char *rulesProperty;
    const char *defaultProperty;
    bool hangup; ///< whether the traffic can be hung up
    const char *invalidDefaultAction; ///< logged
    const char *getAllFailed; ///< logged
    const char *absentService; ///< logged by the constructor
};

/** What a filter has for one kind of traffic, under any names. */
template <typename Filter> struct ChannelMembers {
    bool (Filter::*setDefaultAction)(SimFilter::Action);
    bool (Filter::*setRules)(const RuleList &);
    bool (Filter::*setRule)(const Rule &);
    bool (Filter::*hasRule)(const QString &) const;
    bool (Filter::*removeRule)(const QString &);
    bool (Filter::*clearRules)();
    SimFilter::Action (Filter::*defaultAction)() const;
    RuleList (Filter::*rules)() const;
    bool (Filter::*ready)() const;
};

/** A filter with one of its kinds of traffic. */
class TestedFilter
{
public:
    virtual ~TestedFilter() = default;
    virtual QObject *object() = 0;
    virtual bool setDefaultAction(SimFilter::Action action) = 0;
    virtual bool setRules(const RuleList &rules) = 0;
    virtual bool setRule(const Rule &rule) = 0;
    virtual bool hasRule(const char *imsi) const = 0;
    virtual bool removeRule(const QString &imsi) = 0;
    virtual bool clearRules() = 0;
    virtual SimFilter::Action defaultAction() const = 0;
    virtual RuleList rules() const = 0;
    virtual bool ready() const = 0;
};

template <typename Filter> class TestedFilterOf : public TestedFilter
{
public:
    explicit TestedFilterOf(const ChannelMembers<Filter> &members)
        : m_members(members)
    {
    }
    QObject *object() override { return &m_filter; }
    bool setDefaultAction(SimFilter::Action action) override
    {
        return (m_filter.*m_members.setDefaultAction)(action);
    }
    bool setRules(const RuleList &rules) override { return (m_filter.*m_members.setRules)(rules); }
    bool setRule(const Rule &rule) override { return (m_filter.*m_members.setRule)(rule); }
    bool hasRule(const char *imsi) const override
    {
        return (m_filter.*m_members.hasRule)(QString::fromUtf8(imsi));
    }
    bool removeRule(const QString &imsi) override { return (m_filter.*m_members.removeRule)(imsi); }
    bool clearRules() override { return (m_filter.*m_members.clearRules)(); }
    SimFilter::Action defaultAction() const override { return (m_filter.*m_members.defaultAction)(); }
    RuleList rules() const override { return (m_filter.*m_members.rules)(); }
    bool ready() const override { return (m_filter.*m_members.ready)(); }

private:
    Filter m_filter;
    const ChannelMembers<Filter> m_members;
};

/** One kind of traffic, with the filter that rules it. */
struct TestedChannel {
    ChannelNames names;
    std::function<std::unique_ptr<TestedFilter>()> make;

    QString path() const { return QString::fromLatin1(names.path); }
    /** The service's name for a method or signal: "Add@Rule" is "AddTextRule" for text messages. */
    QString wireName(const char *pattern) const;
    /** "/path AddRule (...)" for each call, given as "Add@Rule (...)". */
    QStringList calls(std::initializer_list<const char *> list) const;
    /** "added 1:block" is "dialRuleAdded(1:block)" for outgoing calls, and so on. */
    QStringList sequence(std::initializer_list<const char *> list) const;
    QString signal(const char *event) const;
};
Q_DECLARE_METATYPE(TestedChannel)

template <typename Filter>
TestedChannel testedChannel(const ChannelNames &names, const ChannelMembers<Filter> &members)
{
    return {names, [members] {
                return std::make_unique<TestedFilterOf<Filter>>(members);
            }};
}

/**
 * What every kind of traffic has to do, as a test of one filter class inherits it: each test runs on each of
 * the filter's kinds of traffic. The rest of the filter is Block without rules.
 */
class RuleChannelTest : public QObject
{
    Q_OBJECT

protected:
    explicit RuleChannelTest(const QVector<TestedChannel> &channels);

    static const QString Service;

    void setServiceRules(const TestedChannel &channel, const RuleList &rules,
                         SimFilter::Action defaultAction);
    void emitFrom(const TestedChannel &channel, const char *member, const QVariantList &arguments);
    QVariantList getAllAnswer(quint32 defaultAction, const QList<WireRule> &rules) const;
    Phone &phone() { return *m_phone; }

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void initialState_data() { addChannels(); }
    void initialState();
    void takesOverTheServicesState_data() { addChannels(); }
    void takesOverTheServicesState();
    void takesOverOnlyWhatIsValid_data() { addChannels(); }
    void takesOverOnlyWhatIsValid();
    void isNeverReadyWhenTheAnswerFails_data() { addChannels(); }
    void isNeverReadyWhenTheAnswerFails();
    void answerOfAnotherTypeIsAFailure_data() { addChannels(); }
    void answerOfAnotherTypeIsAFailure();

    void ruleAdded_data() { addChannels(); }
    void ruleAdded();
    void hangupRuleAdded_data() { addChannels(); }
    void hangupRuleAdded();
    void ruleAddedWithoutImsiOrAction_data() { addChannels(); }
    void ruleAddedWithoutImsiOrAction();
    void ruleAddedTwice_data() { addChannels(); }
    void ruleAddedTwice();
    void ruleChanged_data() { addChannels(); }
    void ruleChanged();
    void ruleChangedOfAnImsiThatIsThereTwice_data() { addChannels(); }
    void ruleChangedOfAnImsiThatIsThereTwice();
    void ruleRemoved_data() { addChannels(); }
    void ruleRemoved();
    void rulesChanged_data() { addChannels(); }
    void rulesChanged();
    void rulesChangedDropsInvalidActions_data() { addChannels(); }
    void rulesChangedDropsInvalidActions();
    void defaultActionChanged_data() { addChannels(); }
    void defaultActionChanged();
    void signalsOfAnotherShapeAreNotTaken_data() { addChannels(); }
    void signalsOfAnotherShapeAreNotTaken();

    void requestsAreSentBeforeTheStateIsKnown_data() { addChannels(); }
    void requestsAreSentBeforeTheStateIsKnown();
    void requestsAreSent_data() { addChannels(); }
    void requestsAreSent();
    void hangupIsSentWhereItExists_data() { addChannels(); }
    void hangupIsSentWhereItExists();
    void refusedRequestsSendNothing_data() { addChannels(); }
    void refusedRequestsSendNothing();
    void requestWithAnInvalidDefaultAction_data() { addChannels(); }
    void requestWithAnInvalidDefaultAction();
    void requestsChangeNothingUntilTheServiceSaysSo_data() { addChannels(); }
    void requestsChangeNothingUntilTheServiceSaysSo();
    void ruleWithAnotherActionIsSent_data() { addChannels(); }
    void ruleWithAnotherActionIsSent();
    void requestsReachTheService_data() { addChannels(); }
    void requestsReachTheService();
    void failedRequestIsLogged_data() { addChannels(); }
    void failedRequestIsLogged();

    void serviceThatIsNotThere_data() { addChannels(); }
    void serviceThatIsNotThere();
    void serviceThatGoesAndComesBack_data() { addChannels(); }
    void serviceThatGoesAndComesBack();
    void twoFiltersSideBySide_data() { addChannels(); }
    void twoFiltersSideBySide();
    void destructionWithCallsPending_data() { addChannels(); }
    void destructionWithCallsPending();
    void deletionInASlot_data();
    void deletionInASlot();
    void propertiesThroughTheMetaObject_data() { addChannels(); }
    void propertiesThroughTheMetaObject();
    void signalsReachQueuedAndNamedConnections_data() { addChannels(); }
    void signalsReachQueuedAndNamedConnections();

private:
    void addChannels();
    std::unique_ptr<TestedFilter> readyFilter(const TestedChannel &channel);
    QStringList takeCalls(const TestedChannel &channel);

    const QVector<TestedChannel> m_channels;
    std::unique_ptr<Phone> m_phone;
};

#endif // CORVANE_RULECHANNELTEST_H
