// SPDX-License-Identifier: LGPL-2.1-or-later
#include "userstorage.h"

#include "sandbox.h"

#include <QtCore/QDir>
#include <QtCore/QDirIterator>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String userFolder("/var/lib/corvane/home");
const QLatin1String mediaFolder("/run/media/card");
const QLatin1String partition("/dev/corvane/home");

constexpr int plainPartitionSize = 1 << 20;

void writeFiles(const QString &folder, const QJsonArray &names)
{
    QDir().mkpath(folder);
    for (const QJsonValue &name : names) {
        const QString fileName = folder + QLatin1Char('/') + name.toString();
        QDir().mkpath(QFileInfo(fileName).path());
        QFile file(fileName);
        if (file.open(QIODevice::WriteOnly))
            file.write("This belongs to the user of the phone.\n");
    }
}

QJsonArray filesIn(const QString &folder)
{
    QStringList names;
    QDirIterator files(folder, QDir::Files | QDir::Hidden | QDir::System, QDirIterator::Subdirectories);
    while (files.hasNext())
        names << QDir(folder).relativeFilePath(files.next());
    names.sort();
    return QJsonArray::fromStringList(names);
}

/** Leaves the folder itself, and what its symbolic links lead to. */
void empty(const QString &folder)
{
    const QFileInfoList entries
        = QDir(folder).entryInfoList(QDir::AllEntries | QDir::Hidden | QDir::System | QDir::NoDotAndDotDot);
    for (const QFileInfo &entry : entries) {
        if (entry.isDir() && !entry.isSymLink())
            QDir(entry.filePath()).removeRecursively();
        else
            QFile::remove(entry.filePath());
    }
}

} // namespace

UserStorage::UserStorage(const QJsonObject &profile)
{
    writeFiles(userFolder, profile.value(QLatin1String("userFiles")).toArray());
    writeFiles(mediaFolder, profile.value(QLatin1String("cardFiles")).toArray());
}

void UserStorage::addFiles(const QJsonObject &profile, PhoneFiles &files)
{
    files.writableFolders.push_back(QString(userFolder).toStdString());
    const QString home = profile.value(QLatin1String("home")).toString();
    std::string &content = files.files[QString(partition).toStdString()];
    if (home == QLatin1String("encrypted")) {
        QFile image(QStringLiteral(":/images/encrypted-home"));
        if (!image.open(QIODevice::ReadOnly))
            qFatal("no image of an encrypted partition is built in");
        content = image.readAll().toStdString();
    } else if (home == QLatin1String("plain")) {
        content.assign(plainPartitionSize, '\0');
    } else {
        files.files.erase(QString(partition).toStdString());
    }
}

void UserStorage::eraseUserData()
{
    empty(userFolder);
}

void UserStorage::eraseExternalMedia()
{
    empty(mediaFolder);
}

void UserStorage::erasePartition()
{
    QFile file(partition);
    if (file.open(QIODevice::ReadWrite | QIODevice::ExistingOnly))
        file.write(QByteArray(int(file.size()), '\0'));
}

QJsonObject UserStorage::describe() const
{
    return {{QStringLiteral("userFiles"), filesIn(userFolder)},
            {QStringLiteral("cardFiles"), filesIn(mediaFolder)}};
}

} // namespace Simulator
} // namespace Corvane
