#include "broker/Describe.h"

#include <sstream>

namespace ObjectManager {

namespace {

std::string quoted(const std::string& text) {
    std::string result = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') {
            result += '\\';
        }
        result += c;
    }
    return result + '"';
}

std::string joined(const std::vector<NamedValue>& values, const char* separator) {
    std::string result;
    for (const NamedValue& value : values) {
        result += (result.empty() ? "" : separator) + value.name + '=' + describe(value.value);
    }
    return result;
}

struct Describer {
    std::string operator()(std::monostate) const { return "NULL"; }
    std::string operator()(bool content) const { return content ? "TRUE" : "FALSE"; }
    std::string operator()(const std::string& content) const { return quoted(content); }
    std::string operator()(const std::shared_ptr<const ObjectPath>& content) const {
        return quoted(describe(*content));
    }
    std::string operator()(const std::shared_ptr<const Instance>& content) const { return quoted(describe(*content)); }
    std::string operator()(const Value::Array& content) const {
        std::string result;
        for (const Value& element : content) {
            result += (result.empty() ? "" : ", ") + describe(element);
        }
        return '{' + result + '}';
    }
    std::string operator()(char16_t content) const { return std::to_string(static_cast<unsigned int>(content)); }
    template <class Number>
    std::string operator()(Number content) const {
        std::ostringstream text;
        text.imbue(std::locale::classic());
        text << content;
        return text.str();
    }
};

} // namespace

std::string describe(const Value& value) {
    return std::visit(Describer{}, value.content);
}

std::string describe(const ObjectPath& path) {
    const std::string host = path.host.empty() ? "" : "//" + path.host + '/';
    const std::string keys = joined(path.keys, ",");
    return host + path.nameSpace + ':' + path.className + (keys.empty() ? "" : '.' + keys);
}

std::string describe(const Instance& instance) {
    return describe(instance.path) + " {" + describe(instance.properties) + '}';
}

std::string describe(const std::vector<NamedValue>& values) {
    return joined(values, ", ");
}

} // namespace ObjectManager
