// SPDX-License-Identifier: LGPL-2.1-or-later
#include "policy.h"

#include "inputfile.h"
#include "jsondocument.h"

#include <QtCore/QFile>

// The macro wants to stand outside of namespaces.
static void initResources()
{
    Q_INIT_RESOURCE(policy);
}

namespace Corvane
{
namespace Agent
{

QJsonObject Policy::settingsOf(const PolicySection &section) const
{
    return settings.value(section.member()).toObject();
}

Policy readPolicy(const QString &fileName, const PolicySections &sections)
{
    const JsonDocument document = readJsonDocument(fileName, policySchema());
    Policy policy{document.object.value(QLatin1String("name")).toString(inputFileName(fileName)),
                  document.object, document.error};
    if (!policy.isValid())
        return policy;
    for (const auto &section : sections) {
        const QString fault = section->fault(policy.settingsOf(*section));
        if (!fault.isEmpty()) {
            policy.error = QStringLiteral("%1: %2").arg(inputFileName(fileName), fault);
            break;
        }
    }
    return policy;
}

QByteArray policySchema()
{
    initResources();
    QFile file(QStringLiteral(":/corvanemdm/policy.schema.json"));
    if (!file.open(QIODevice::ReadOnly))
        qFatal("the schema of policies is missing from the program");
    return file.readAll();
}

} // namespace Agent
} // namespace Corvane
