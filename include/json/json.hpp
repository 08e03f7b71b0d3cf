#ifndef JSON_JSON_HPP
#define JSON_JSON_HPP

// Everything jsonvalue offers: the value model and the writer.
#include <json/serializer.hpp>
#include <json/value.hpp>

#endif
