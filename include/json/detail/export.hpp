#ifndef JSON_DETAIL_EXPORT_HPP
#define JSON_DETAIL_EXPORT_HPP

// The library is built with hidden visibility; only declarations marked JSONVALUE_API are
// exported from libjsonvalue.so, and all of them live in namespace json.
#define JSONVALUE_API __attribute__((visibility("default")))

#endif
