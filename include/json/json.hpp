#ifndef JSON_JSON_HPP
#define JSON_JSON_HPP

// Everything jsonvalue offers: the value model, conversions, the builders, the writer and
// parsing.
#include <json/builders.hpp>
#include <json/convert.hpp>
#include <json/parse.hpp>
#include <json/serializer.hpp>
#include <json/value.hpp>

#endif
