/// \file
/// What the user gave for the parameters of one command, by the names of the command table.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace VORK::FILEINDEXCTL {

class Arguments {
public:
    using Values = std::vector<std::string>;

    void Set(std::string_view name, Values values) {
        values_.insert_or_assign(std::string(name), std::move(values));
    }

    bool Has(std::string_view name) const { return values_.contains(name); }

    /// The values of the parameter in the order given; none when it was not given.
    const Values &All(std::string_view name) const {
        static const Values none;
        const auto found = values_.find(name);
        return found == values_.end() ? none : found->second;
    }

    /// The only value; empty when the parameter was not given.
    std::string One(std::string_view name) const { return Has(name) ? All(name).front() : std::string(); }

    /// The value of an option that takes a number, else `otherwise`.
    unsigned long Number(std::string_view name, unsigned long otherwise) const {
        return Has(name) ? std::stoul(One(name)) : otherwise;
    }

private:
    std::map<std::string, Values, std::less<>> values_;
};

}  // namespace VORK::FILEINDEXCTL
