/**
 * @file
 * @brief Tessaline: the whole interface in one include.
 *
 * Subsystems: configuration store (config), paths and file services
 * (files), text encryption (crypt), threads (thread), and text, numbers and
 * time (util). Each header can also be included on its own.
 */
#ifndef TESSALINE_TESSALINE_H
#define TESSALINE_TESSALINE_H

#include "tessaline/export.h"
#include "tessaline/crypt/twofish.h"
#include "tessaline/crypt/rvEncrypt.h"
#include "tessaline/files/rvCopy.h"
#include "tessaline/files/rvDirIterator.h"
#include "tessaline/files/rvFileApi.h"
#include "tessaline/thread/MThread.h"
#include "tessaline/util/rvString.h"
#include "tessaline/util/rvTime.h"
#include "tessaline/util/HashToken.h"
#include "tessaline/files/rvFilename.h"
#include "tessaline/files/rvPath.h"
#include "tessaline/files/rvSharedLib.h"
#include "tessaline/config/rvConfig.h"

#endif
