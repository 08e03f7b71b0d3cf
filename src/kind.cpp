#include <json/kind.hpp>
#include <json/value.hpp>

namespace json {

// The JSON kinds carry the display names of the alternatives that hold them; a float is a JSON
// number like a double (its own name, "float", is the C++ type's).
const char* kind_name(Kind kind) noexcept {
    switch (kind) {
    case Kind::UNDEFINED:
        return "no value";
    case Kind::NULL_VALUE:
        return traits<Null>::name;
    case Kind::BOOLEAN:
        return traits<bool>::name;
    case Kind::NUMBER:
        return traits<double>::name;
    case Kind::STRING:
        return traits<std::string>::name;
    case Kind::ARRAY:
        return traits<Array>::name;
    case Kind::OBJECT:
        return traits<Object>::name;
    }
    return "no value";
}

} // namespace json
