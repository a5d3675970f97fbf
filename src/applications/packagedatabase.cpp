// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packagedatabase_p.h"

#include <QtCore/QDebug>

#include <rpm/header.h>
#include <rpm/rpmdb.h>
#include <rpm/rpmlib.h>
#include <rpm/rpmtd.h>

#include <memory>

namespace Corvane
{
namespace Mdm
{

namespace
{

struct Free {
    void operator()(rpmdbMatchIterator iterator) const { rpmdbFreeIterator(iterator); }
    void operator()(rpmtd data) const
    {
        rpmtdFreeData(data);
        rpmtdFree(data);
    }
};
using Matches = std::unique_ptr<rpmdbMatchIterator_s, Free>;
using TagData = std::unique_ptr<rpmtd_s, Free>;

/** The text of @p tag; empty, with the warning @p missing when there is one, if @p header lacks it. */
QString textOf(Header header, rpmTagVal tag, const char *missing = nullptr)
{
    const TagData data(rpmtdNew());
    if (!headerGet(header, tag, data.get(), HEADERGET_DEFAULT)) {
        if (missing)
            qWarning("%s", missing);
        return QString();
    }
    const char *text = rpmtdGetString(data.get());
    if (!text)
        qWarning("RPM header didn't return string as expected");
    return QString::fromUtf8(text);
}

PackageEntry entryOf(Header header)
{
    // Not as arguments, which compilers evaluate in any order, and the warnings with them.
    const QString name = textOf(header, RPMTAG_NAME, "rpm headerGet failed for name");
    const QString version = textOf(header, RPMTAG_VERSION, "rpm headerGet failed for version");
    const QString vendor = textOf(header, RPMTAG_VENDOR);
    return PackageEntry(name, version, vendor);
}

} // namespace

PackageDatabase::PackageDatabase()
    : m_transactions(rpmtsCreate())
{
}

PackageDatabase::~PackageDatabase()
{
    rpmtsFree(m_transactions);
}

void PackageDatabase::configure()
{
    // Other threads wait until it is done.
    static const int status = rpmReadConfigFiles(nullptr, nullptr);
    Q_UNUSED(status)
}

QList<PackageEntry> PackageDatabase::packages() const
{
    QList<PackageEntry> entries;
    const Matches all(rpmtsInitIterator(m_transactions, RPMDBI_PACKAGES, nullptr, 0));
    while (const Header header = rpmdbNextIterator(all.get()))
        entries.append(entryOf(header));
    return entries;
}

PackageEntry PackageDatabase::ownerOf(const QString &file) const
{
    const QByteArray path = file.toUtf8();
    const Matches owners(rpmtsInitIterator(m_transactions, RPMDBI_BASENAMES, path.constData(), 0));
    const Header header = rpmdbNextIterator(owners.get());
    return header ? entryOf(header) : PackageEntry();
}

} // namespace Mdm
} // namespace Corvane
