#include "input.h"

#include <fstream>
#include <iterator>
#include <map>
#include <sstream>
#include <utility>
#include <vector>

namespace fileindex_fuzz {

namespace {

using Grammar = std::map<std::string, std::vector<std::string>>;  ///< forms by name

Grammar ReadGrammar() {
    Grammar grammar;
    std::ifstream file(GRAMMAR);
    for (std::string line, name; std::getline(file, line);) {
        std::istringstream words(line);
        words >> name;  // "#" is the name of the comments, which no form names
        std::vector<std::string> &forms = grammar[name];
        forms.insert(forms.end(), std::istream_iterator<std::string>(words), {});
    }
    return grammar;
}

}  // namespace

std::size_t Input::Below(std::size_t bound) {
    std::size_t value = 0;
    for (std::size_t reach = 1; reach < bound && !left_.empty(); reach <<= 8U) {
        value = value << 8U | static_cast<unsigned char>(left_.front());
        left_.remove_prefix(1);
    }
    return value % bound;
}

std::string Input::Rest() {
    return std::string(std::exchange(left_, {}));
}

std::string Input::Text(const std::string &name) {
    static const Grammar grammar = ReadGrammar();
    const std::string rare = name + "|";
    const std::vector<std::string> &forms = grammar.at(grammar.contains(rare) && OneIn(10) ? rare : name);
    const std::string &form = forms[Below(forms.size())];
    std::string text;
    for (std::size_t i = 0; i < form.size(); ++i) {
        if (form[i] == '$') {
            text += Text({form[++i]});
        } else if (form[i] == '%') {
            text += static_cast<char>(std::stoi(form.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            text += form[i];
            const bool mayStandBeforeBlank = std::string_view("[{,:").find(form[i]) != std::string_view::npos;
            text += mayStandBeforeBlank && OneIn(12) ? Text("w") : "";
        }
    }
    return text;
}

std::string Input::MaybeSpoilt(const std::string &name) {
    if (OneIn(10)) {
        return Rest();
    }
    std::string text = Text(name);
    if (!OneIn(4)) {
        return text;
    }
    const std::size_t at = Below(text.size() + 1);
    return OneIn(3) ? text.substr(0, at)
                    : text.replace(at, Below(2), OneIn(3) ? std::string(1, '\xC3') : Text("q"));
}

}  // namespace fileindex_fuzz
