// SPDX-License-Identifier: LGPL-2.1-or-later
#include "databaseprogram.h"

#include "glibpointers.h"

#include <QtCore/QFile>
#include <QtCore/QJsonDocument>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String databaseFile("/var/lib/rpm/rpmdb.sqlite");
constexpr char databaseProgram[] = "corvane-package-database";

using Done = std::function<void(const QString &problem)>;

GObjectPointer<GSubprocess> startDatabaseProgram(const std::vector<QByteArray> &arguments, QString &problem)
{
    std::vector<const gchar *> command{databaseProgram};
    for (const QByteArray &argument : arguments)
        command.push_back(argument.constData());
    command.push_back(nullptr);
    ErrorSlot error;
    GObjectPointer<GSubprocess> process(g_subprocess_newv(
        command.data(), GSubprocessFlags(G_SUBPROCESS_FLAGS_STDIN_PIPE | G_SUBPROCESS_FLAGS_STDERR_PIPE),
        &error));
    if (!process)
        problem = QString::fromUtf8(error->message);
    return process;
}

QString outcomeOf(GSubprocess *process, const gchar *output, const ErrorSlot &error)
{
    if (error)
        return QString::fromUtf8(error->message);
    return g_subprocess_get_successful(process) ? QString() : QString::fromUtf8(output).trimmed();
}

} // namespace

void runDatabaseProgram(const std::vector<QByteArray> &arguments, const QByteArray &input,
                        std::function<void(const QString &)> done)
{
    QString problem;
    const GObjectPointer<GSubprocess> process = startDatabaseProgram(arguments, problem);
    if (!process) {
        done(problem);
        return;
    }
    g_subprocess_communicate_utf8_async(
        process.get(), input.constData(), nullptr,
        [](GObject *source, GAsyncResult *result, gpointer data) {
            const std::unique_ptr<Done> finished(static_cast<Done *>(data));
            gchar *output = nullptr;
            ErrorSlot error;
            g_subprocess_communicate_utf8_finish(G_SUBPROCESS(source), result, nullptr, &output, &error);
            const GCharPointer words(output);
            (*finished)(outcomeOf(G_SUBPROCESS(source), words.get(), error));
        },
        new Done(std::move(done)));
}

void fillPackageDatabase(const QJsonArray &packages)
{
    if (QFile::exists(databaseFile))
        return;
    const QByteArray input = QJsonDocument(packages).toJson(QJsonDocument::Compact);
    QString problem;
    const GObjectPointer<GSubprocess> process = startDatabaseProgram({"add"}, problem);
    if (process) {
        gchar *output = nullptr;
        ErrorSlot error;
        g_subprocess_communicate_utf8(process.get(), input.constData(), nullptr, nullptr, &output, &error);
        problem = outcomeOf(process.get(), GCharPointer(output).get(), error);
    }
    if (!problem.isEmpty())
        qWarning("the phone has no package database: %s", qUtf8Printable(problem));
}

} // namespace Simulator
} // namespace Corvane
