/// \file
/// A configuration file in reach of its tests, by way of status.conf.
#ifndef FILEINDEX_TESTS_UNIT_CONFIG_DOCUMENT_H
#define FILEINDEX_TESTS_UNIT_CONFIG_DOCUMENT_H

#include "fixture.h"

#include <sys/stat.h>

#include <string>

namespace fileindex_test {

/// status.conf with its content in reach.
class Document : public Status {
public:
    Document() = default;
    explicit Document(const std::string &text) { document_ = Parse(text); }
    [[nodiscard]] std::string Text() const { return Print(document_); }
};

class UmaskOf {
public:
    explicit UmaskOf(mode_t mask) : before_(::umask(mask)) {}
    ~UmaskOf() { ::umask(before_); }
    UmaskOf(const UmaskOf &) = delete;
    UmaskOf &operator=(const UmaskOf &) = delete;

private:
    mode_t before_;
};

inline struct stat StatusOf(const std::string &path) {
    struct stat status = {};
    EXPECT_EQ(0, ::stat(path.c_str(), &status)) << path;
    return status;
}

}  // namespace fileindex_test

#endif
