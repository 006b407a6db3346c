/// \file
/// Short forms for what programs get.
#pragma once

#include <json/value.h>

#include <concepts>
#include <functional>
#include <initializer_list>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace VORK::FILEINDEXCTL {

/// An array of what `of` gives for each item: of all texts, or of one member.
template <typename Range = std::vector<std::string>, typename Projection = std::identity>
Json::Value ToArray(const Range &items, Projection of = {}) {
    Json::Value array(Json::arrayValue);
    for (const auto &item : items) {
        array.append(std::invoke(of, item));
    }
    return array;
}

inline Json::Value ToObject(std::initializer_list<std::pair<const char *, Json::Value>> members) {
    Json::Value object(Json::objectValue);
    for (const auto &[name, value] : members) {
        object[name] = value;
    }
    return object;
}

/// Json::Value knows only some of the integer types.
template <std::integral Integer>
Json::Value ToNumber(Integer number) {
    using Widest = std::conditional_t<std::is_signed_v<Integer>, Json::Int64, Json::UInt64>;
    return {static_cast<Widest>(number)};
}

/// null for an empty text.
inline Json::Value OrNull(const std::string &text) {
    return text.empty() ? Json::Value() : Json::Value(text);
}

template <typename Value>
Json::Value OrNull(const std::optional<Value> &value) {
    return value ? Json::Value(*value) : Json::Value();
}

}  // namespace VORK::FILEINDEXCTL
