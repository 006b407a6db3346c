/// \file
/// Visibility of the interface: everything else in the shared library is hidden.
#ifndef FILEINDEX_EXPORT_H
#define FILEINDEX_EXPORT_H

/// Marks what the shared library exports.
#define FILEINDEX_API __attribute__((visibility("default")))

#endif
