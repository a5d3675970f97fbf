// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_POLICYSECTION_H
#define CORVANE_POLICYSECTION_H

#include "reply.h"
#include "service.h"
#include "setting.h"

#include <QtCore/QJsonObject>
#include <QtCore/QObject>
#include <QtCore/QVector>

namespace Corvane
{
namespace Agent
{

/**
 * The part of a policy that is about one feature family.
 *
 * The engine calls open() before anything that looks at the phone, and close() when the service has left.
 * @c wanted is the section's member of the policy, which the schema and fault() have accepted.
 */
class PolicySection : public QObject
{
    Q_OBJECT

public:
    explicit PolicySection(QObject *parent = nullptr)
        : QObject(parent)
    {
    }

    /** The member of the policy. */
    virtual QString member() const = 0;

    /** The service that answers for the settings. */
    virtual Service service() const = 0;

    /** What is wrong with @p wanted beyond the schema, after its JSON Pointer; empty when nothing is. */
    virtual QString fault(const QJsonObject &wanted) const = 0;

    /** The settings that @p wanted names, in the order of reports, without looking at the phone. */
    virtual QVector<Setting> settings(const QJsonObject &wanted) const = 0;

    /** Connects to the service, and waits until the state of what @p wanted names is known. */
    virtual Reply open(const QJsonObject &wanted) = 0;

    virtual void close() = 0;

    /** Makes the phone look outside for what applying depends on. */
    virtual Reply refresh() { return {}; }

    /** Fills in how the phone stands to each of settings(). */
    virtual QVector<Setting> compare(const QJsonObject &wanted) = 0;

    /**
     * Whether the phone may differ from what compare() last told without having announced it. Asked again and
     * again while a policy is watched, so that a section which says so without need makes work.
     */
    virtual bool mayHaveDrifted() { return false; }

    /** Makes one different setting of compare() so, and waits until the service confirms it. */
    virtual Reply change(const Setting &setting) = 0;

    /** The phone's present state, as a policy would ask for it. */
    virtual QJsonObject exported() = 0;

Q_SIGNALS:
    /** The phone has announced something by which it may differ from what compare() last told. */
    void drifted();

    /** change() has come so far with the setting at @p path. */
    void progress(const QString &path, int percent);
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_POLICYSECTION_H
