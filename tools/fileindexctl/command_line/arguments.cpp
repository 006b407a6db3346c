#include "command_line/arguments.h"

#include <utility>

namespace VORK::FILEINDEXCTL {

void Arguments::Set(std::string_view name, std::vector<std::string> values) {
    values_.insert_or_assign(std::string(name), std::move(values));
}

bool Arguments::Has(std::string_view name) const {
    return values_.find(name) != values_.end();
}

const std::vector<std::string> &Arguments::All(std::string_view name) const {
    static const std::vector<std::string> none;
    const auto found = values_.find(name);
    return found == values_.end() ? none : found->second;
}

std::string Arguments::One(std::string_view name) const {
    const auto &values = All(name);
    return values.empty() ? std::string() : values.front();
}

unsigned long Arguments::Number(std::string_view name, unsigned long otherwise) const {
    return Has(name) ? std::stoul(One(name)) : otherwise;
}

}  // namespace VORK::FILEINDEXCTL
