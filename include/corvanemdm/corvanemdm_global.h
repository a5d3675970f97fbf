// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_GLOBAL_H
#define CORVANEMDM_GLOBAL_H

#include <QtCore/qglobal.h>

/** Marks what the library exports; everything else stays hidden. */
#if defined(CORVANEMDM_BUILD_LIBRARY)
#define CORVANEMDM_EXPORT Q_DECL_EXPORT
#else
#define CORVANEMDM_EXPORT Q_DECL_IMPORT
#endif

#endif // CORVANEMDM_GLOBAL_H
