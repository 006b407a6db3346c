/// \file
/// What the user gave for the parameters of one command, by the names of the command table.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace VORK::FILEINDEXCTL {

class Arguments {
public:
    void Set(std::string_view name, std::vector<std::string> values);

    bool Has(std::string_view name) const;

    /// The values of the parameter in the order given; none when it was not given.
    const std::vector<std::string> &All(std::string_view name) const;

    /// The only value; empty when the parameter was not given.
    std::string One(std::string_view name) const;

    /// The value of an option that takes a number, else `otherwise`.
    unsigned long Number(std::string_view name, unsigned long otherwise) const;

private:
    std::map<std::string, std::vector<std::string>, std::less<>> values_;
};

}  // namespace VORK::FILEINDEXCTL
