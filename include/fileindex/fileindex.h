/// \file
/// The whole C++ interface of the file index. Read index_mgr.h first, then status_mgr.h; the others are what
/// those two are made of.
///
/// Nothing is kept between calls: every operation does its work in the caller's thread and returns. Files are
/// locked between processes; objects are not shared between threads.
#ifndef FILEINDEX_FILEINDEX_H
#define FILEINDEX_FILEINDEX_H

#include <fileindex/config.h>
#include <fileindex/daemon.h>
#include <fileindex/error.h>
#include <fileindex/fileidx.h>
#include <fileindex/folder.h>
#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/json_access.h>
#include <fileindex/paths.h>
#include <fileindex/status.h>
#include <fileindex/status_mgr.h>
#include <fileindex/updater.h>

#endif
