/// \file
/// The elements of a JSON array as a range, and the names in an object.
#pragma once

#include <json/value.h>

namespace VORK {

/// By index, because the JSON library's own iterators pass over elements that were never assigned: such an element
/// is null to everyone else, and counts.
class Elements {
public:
    explicit Elements(const Json::Value &array) : array_(array) {}

    class Iterator {
    public:
        Iterator(const Json::Value &array, Json::ArrayIndex index) : array_(array), index_(index) {}
        const Json::Value &operator*() const { return array_[index_]; }
        Iterator &operator++() {
            ++index_;
            return *this;
        }
        bool operator!=(const Iterator &other) const { return index_ != other.index_; }

    private:
        const Json::Value &array_;
        Json::ArrayIndex index_;
    };

    Iterator begin() const { return {array_, 0}; }
    Iterator end() const { return {array_, array_.size()}; }

private:
    const Json::Value &array_;
};

/// In sorted order; none for what is no object.
inline Json::Value::Members MemberNames(const Json::Value &object) {
    return object.isObject() ? object.getMemberNames() : Json::Value::Members();
}

}  // namespace VORK
