#ifndef JSON_DETAIL_GRAMMAR_HPP
#define JSON_DETAIL_GRAMMAR_HPP

// The one JSON grammar behind every reader: json::parse (with the document builder as its
// handler), json::validate and json::parse_events. Header-level, for parse_events: a
// handler's calls are inlined into the token loop. In four parts: the token loop, literals
// and numbers, strings, and what lies between tokens.

#include <json/detail/grammar_gaps.hpp>
#include <json/detail/grammar_loop.hpp>
#include <json/detail/grammar_scalars.hpp>
#include <json/detail/grammar_strings.hpp>

#endif
