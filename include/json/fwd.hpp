#ifndef JSON_FWD_HPP
#define JSON_FWD_HPP

// Declarations of jsonvalue's types, for headers and programs that name them without needing
// their definitions.

#include <map>
#include <string>
#include <vector>

namespace json {

class Undefined;
class Null;
class Value;

/// A JSON array: elements in insertion order.
using Array = std::vector<Value>;

/// A JSON object: each key once, members in ascending byte-wise (unsigned) key order.
using Object = std::map<std::string, Value>;

class Pointer;
struct ConvertOptions;
struct ParseOptions;
struct ParseReport;
struct WriteOptions;
class Writer;

} // namespace json

#endif
