// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_USERSTORAGE_H
#define CORVANE_SIMULATOR_USERSTORAGE_H

#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Simulator
{

struct PhoneFiles;

/**
 * What the phone's user keeps on it. It lies in folders of the phone's own: /home is the machine's, and out
 * of reach of whatever erases the phone.
 */
class UserStorage
{
public:
    /** Writes the files of @p profile, a phone's "storage". */
    explicit UserStorage(const QJsonObject &profile);

    /** Adds what has to be there before the phone's services are. */
    static void addFiles(const QJsonObject &profile, PhoneFiles &files);

    void eraseUserData();
    void eraseExternalMedia();
    /** Overwrites the data partition, its encryption included. */
    void erasePartition();

    QJsonObject describe() const;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_USERSTORAGE_H
