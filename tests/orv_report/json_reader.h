// A small JSON reader for the tests of report.json: objects, arrays, strings (with the
// escapes the writer uses), numbers, true, false, null. Throws on malformed text.
#pragma once

#include <cstdlib>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace report_test {

struct Json {
    enum Type { Null, Bool, Number, String, Array, Object } type = Null;
    bool b = false;
    double num = 0;
    std::string str, raw;  // raw: a number's text as written
    std::vector<Json> items;
    std::map<std::string, Json> members;

    const Json& operator[](const std::string& key) const {
        const auto it = members.find(key);
        if (type != Object || it == members.end()) throw std::runtime_error("no member " + key);
        return it->second;
    }
    const Json& operator[](std::size_t i) const { return items.at(i); }
    bool isNull() const { return type == Null; }
};

class JsonParser {
public:
    explicit JsonParser(const std::string& text) : s_(text) {}
    Json parse() {
        Json v = value();
        skip();
        if (i_ != s_.size()) fail();
        return v;
    }

private:
    [[noreturn]] void fail() { throw std::runtime_error("bad JSON at " + std::to_string(i_)); }
    void skip() {
        while (i_ < s_.size() &&
               (s_[i_] == ' ' || s_[i_] == '\n' || s_[i_] == '\r' || s_[i_] == '\t'))
            ++i_;
    }
    bool eat(char c) {
        skip();
        if (i_ < s_.size() && s_[i_] == c) return ++i_, true;
        return false;
    }
    bool word(const char* w) {
        const std::string x(w);
        if (s_.compare(i_, x.size(), x) != 0) return false;
        i_ += x.size();
        return true;
    }
    std::string string() {
        if (!eat('"')) fail();
        std::string out;
        while (i_ < s_.size() && s_[i_] != '"') {
            char c = s_[i_++];
            if (c == '\\') {
                if (i_ >= s_.size()) fail();
                c = s_[i_++];
                if (c == 'u') {
                    out += static_cast<char>(std::strtol(s_.substr(i_, 4).c_str(), nullptr, 16));
                    i_ += 4;
                    continue;
                }
            }
            out += c;
        }
        if (!eat('"')) fail();
        return out;
    }
    Json value() {
        skip();
        Json v;
        if (i_ >= s_.size()) fail();
        const char c = s_[i_];
        if (c == '{') {
            v.type = Json::Object;
            ++i_;
            if (eat('}')) return v;
            do {
                std::string k = string();
                if (!eat(':')) fail();
                v.members[k] = value();
            } while (eat(','));
            if (!eat('}')) fail();
        } else if (c == '[') {
            v.type = Json::Array;
            ++i_;
            if (eat(']')) return v;
            do v.items.push_back(value());
            while (eat(','));
            if (!eat(']')) fail();
        } else if (c == '"') {
            v.type = Json::String;
            v.str = string();
        } else if (word("true") || word("false")) {
            v.type = Json::Bool;
            v.b = s_[i_ - 1] == 'e' && s_[i_ - 2] == 'u';
        } else if (word("null")) {
        } else {
            char* end = nullptr;
            v.type = Json::Number;
            v.num = std::strtod(s_.c_str() + i_, &end);
            if (end == s_.c_str() + i_) fail();
            v.raw = s_.substr(i_, static_cast<std::size_t>(end - (s_.c_str() + i_)));
            i_ = static_cast<std::size_t>(end - s_.c_str());
        }
        return v;
    }
    const std::string& s_;
    std::size_t i_ = 0;
};

inline Json parseJson(const std::string& text) { return JsonParser(text).parse(); }

}  // namespace report_test
