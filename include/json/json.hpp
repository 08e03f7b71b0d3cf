#ifndef JSON_JSON_HPP
#define JSON_JSON_HPP

// Everything jsonvalue offers: the value model, conversions, the builders, the writers
// (from a document or from events), parsing, and patches.
#include <json/builders.hpp>
#include <json/convert.hpp>
#include <json/events.hpp>
#include <json/parse.hpp>
#include <json/patch.hpp>
#include <json/pointer.hpp>
#include <json/serializer.hpp>
#include <json/value.hpp>
#include <json/writer.hpp>

#endif
