#ifndef JSON_JSON_HPP
#define JSON_JSON_HPP

// Everything jsonvalue offers: the value model, conversions, the builders, the writers
// (from a document or from events), parsing, records one at a time, patches, and the version
// macros.
#include <json/builders.hpp>
#include <json/convert.hpp>
#include <json/convert_options.hpp>
#include <json/events.hpp>
#include <json/parse.hpp>
#include <json/parse_options.hpp>
#include <json/patch.hpp>
#include <json/pointer.hpp>
#include <json/records.hpp>
#include <json/serializer.hpp>
#include <json/text_conversion.hpp>
#include <json/value.hpp>
#include <json/version.hpp>
#include <json/writer.hpp>

#endif
