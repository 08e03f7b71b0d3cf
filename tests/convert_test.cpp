// value_from and value_to: standard types both ways, described structs and enums, the user's
// hooks, and where each failure is reported.
#include "support/documents.hpp"
#include "support/errors.hpp"

#include <json/json.hpp>

#include <boost/describe.hpp>
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdint>
#include <deque>
#include <forward_list>
#include <limits>
#include <list>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <tuple>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace shop {

enum class Currency { EUR, USD };
BOOST_DESCRIBE_ENUM(Currency, EUR, USD)

struct Price {
    double amount;
    Currency currency;
};
BOOST_DESCRIBE_STRUCT(Price, (), (amount, currency))

struct Item {
    std::string name;
    Price price;
    std::optional<int> stock;
    std::vector<std::string> tags;
};
BOOST_DESCRIBE_STRUCT(Item, (), (name, price, stock, tags))

struct Order {
    std::vector<Item> items;
    std::map<std::string, std::pair<int, bool>> notes;
};
BOOST_DESCRIBE_STRUCT(Order, (), (items, notes))

// A type with hooks of its own: written as "x,y".
struct Point {
    int x = 0, y = 0;
};
void to_json(json::Value& out, const Point& point) {
    out = std::to_string(point.x) + "," + std::to_string(point.y);
}
void from_json(const json::Value& in, Point& point) {
    const std::string& text = in.as_string();
    point.x = std::stoi(text);
    point.y = std::stoi(text.substr(text.find(',') + 1));
}
bool operator==(const Point& a, const Point& b) {
    return a.x == b.x && a.y == b.y;
}

} // namespace shop

namespace config {

struct Endpoint {
    std::string host = "localhost";
    int port = 8080;
};
BOOST_DESCRIBE_STRUCT(Endpoint, (), (host, port))

// Members of its own and inherited ones, each with a default.
struct Server : Endpoint {
    std::optional<int> timeout = 30;
};
BOOST_DESCRIBE_STRUCT(Server, (Endpoint), (timeout))

struct Settings {
    Server server;
    std::vector<Server> replicas;
    std::map<std::string, std::pair<Server, int>> named;
};
BOOST_DESCRIBE_STRUCT(Settings, (), (server, replicas, named))

} // namespace config

namespace {

using json::Value;
using json::value_from;
using json::value_to;

template <typename T>
void expect_round_trip(const T& value, const char* text) {
    const Value converted = value_from(value);
    EXPECT_EQ(json::serialize(converted), text);
    EXPECT_EQ(value_to<T>(converted), value) << text;
}

// The types side by side in tuples, whose elements convert one by one as each would alone.
TEST(Convert, StandardTypesBothWays) {
    expect_round_trip(std::tuple(true, -7, std::uint64_t{1} << 53, std::int8_t{-128}, 0.1, 0.1f,
                                 std::string("text"), nullptr, Value(json::Array{1, "x"}),
                                 std::optional<int>(), std::optional<int>(3)),
                      R"([true,-7,9007199254740992,-128,0.1,0.1,"text",null,[1,"x"],null,3])");
    expect_round_trip(std::tuple(std::vector<int>{1, 2}, std::deque<bool>{true},
                                 std::list<std::string>{"a", "b"}, std::array<int, 2>{4, 5},
                                 std::set<int>{3, 1}, std::unordered_set<int>{9},
                                 std::vector<std::optional<int>>{1, std::nullopt}),
                      R"([[1,2],[true],["a","b"],[4,5],[1,3],[9],[1,null]])");
    expect_round_trip(std::tuple(std::map<std::string, int>{{"b", 2}, {"a", 1}},
                                 std::unordered_map<std::string, double>{{"k", 0.5}},
                                 std::pair<int, std::string>(1, "one")),
                      R"([{"a":1,"b":2},{"k":0.5},[1,"one"]])");
    // A range without size() is counted before its Array is made.
    EXPECT_EQ(json::serialize(json::value_from(std::forward_list<int>{1, 2, 3})), "[1,2,3]");
    // A type's own hooks come before any conversion the library has for it.
    expect_round_trip(std::vector<shop::Point>{{1, 2}, {3, 4}}, R"(["1,2","3,4"])");
    EXPECT_EQ(value_from("literal"), "literal");
    EXPECT_EQ(value_from(std::string_view("view")), "view");
    EXPECT_EQ(value_to<std::optional<int>>(Value()), std::nullopt);
    EXPECT_EQ(value_from(2.5f).which(), 7); // a float stays single precision
}

template <typename T>
std::string failure(const Value& value) {
    return test_support::error_of([&] { value_to<T>(value); });
}

using IntArray3 = std::array<int, 3>;
using IntPair = std::pair<int, int>;
using IntMap = std::map<std::string, int>;

TEST(Convert, RangeAndKindFailuresNameTheNumber) {
    EXPECT_EQ(failure<std::uint8_t>(256), "invalid: expected an integer from 0 to 255, found 256");
    EXPECT_EQ(failure<unsigned>(-1), "invalid: expected an integer from 0 to 4294967295, found -1");
    EXPECT_EQ(failure<int>(1.5), "invalid: expected an integer from -2147483648 to 2147483647, "
                                 "found 1.5");
    EXPECT_EQ(failure<std::int64_t>(9223372036854775808.0),
              "invalid: expected an integer from -9223372036854775808 to 9223372036854775807, "
              "found 9223372036854775808");
    EXPECT_EQ(value_to<std::int64_t>(Value(-9223372036854775808.0)), INT64_MIN);
    EXPECT_EQ(failure<float>(1e300), "invalid: expected a number within the range of float, "
                                     "found 1e+300");
    EXPECT_EQ(failure<int>("7"), "invalid: expected JSON number, found JSON string");
    EXPECT_EQ(failure<std::nullptr_t>(0), "invalid: expected JSON null, found JSON number");
    EXPECT_EQ(failure<std::nullptr_t>(2.5f), "invalid: expected JSON null, found JSON number");
    EXPECT_EQ(failure<int>(Value()), "invalid: expected JSON number, found no value");
    EXPECT_EQ(failure<IntArray3>(json::Array{1, 2}),
              "missing: /2: missing element (expected JSON array of 3 elements, found 2)");
    EXPECT_EQ(failure<IntPair>(json::Array{1, 2, 3}),
              "invalid: expected JSON array of 2 elements, found 3");
    EXPECT_EQ(failure<IntMap>(json::Object{{"a/b~", true}}),
              "invalid: /a~1b~0: expected JSON number, found JSON boolean");
    EXPECT_EQ(
        failure<std::vector<std::vector<int>>>(json::Array{json::Array{}, json::Array{1, "x"}}),
        "invalid: /1/1: expected JSON number, found JSON string");
    EXPECT_EQ(failure<std::vector<shop::Point>>(json::Array{json::Array{}}),
              "invalid: /0: expected JSON string, found JSON array");
}

// Every float the library writes reads back as the same float; doubles from halfway between
// the largest float and 2^128 up are refused.
TEST(Convert, FloatsWrittenConvertBack) {
    constexpr float max = std::numeric_limits<float>::max();
    for (const float number : {max, -max, std::numeric_limits<float>::min(),
                               std::numeric_limits<float>::denorm_min(), 0.1f}) {
        Value read;
        ASSERT_TRUE(json::parse(json::serialize(value_from(number)), read, {})) << number;
        EXPECT_EQ(value_to<float>(read), number) << json::serialize(read);
    }
    const double halfway = std::ldexp(1.0, 128) - std::ldexp(1.0, 103);
    EXPECT_EQ(value_to<float>(std::nextafter(halfway, 0.0)), max);
    EXPECT_EQ(value_to<float>(-std::nextafter(halfway, 0.0)), -max);
    for (const double refused : {halfway, -halfway}) {
        EXPECT_THROW(value_to<float>(refused), std::invalid_argument) << refused;
    }
}

const char* const ORDER_TEXT =
    R"({"items":[{"name":"pen","price":{"amount":1.5,"currency":"EUR"},"stock":3,"tags":["a"]},)"
    R"({"name":"ink","price":{"amount":20,"currency":"USD"},"stock":null,"tags":[]}],)"
    R"("notes":{"gift":[1,true]}})";

TEST(Convert, DescribedStructsAndEnums) {
    const shop::Order order{{{"pen", {1.5, shop::Currency::EUR}, 3, {"a"}},
                             {"ink", {20, shop::Currency::USD}, std::nullopt, {}}},
                            {{"gift", {1, true}}}};
    const Value converted = value_from(order);
    EXPECT_EQ(json::serialize(converted), ORDER_TEXT);
    const auto back = value_to<shop::Order>(converted);
    EXPECT_EQ(json::serialize(value_from(back)), ORDER_TEXT);

    // A missing optional member is nullopt; members the struct does not know are ignored.
    Value lean = converted;
    lean.at_pointer("/items/0").as_object().erase("stock");
    lean.at_pointer("/items/0").as_object()["unknown"] = 1;
    EXPECT_EQ(value_to<shop::Order>(lean).items[0].stock, std::nullopt);

    const struct {
        const char* pointer;
        Value replacement;
        const char* message;
    } broken[] = {
        {"/items/1/price/amount", "20",
         "invalid: /items/1/price/amount: expected JSON number, found JSON string"},
        {"/items/0/price/currency", "GBP",
         "invalid: /items/0/price/currency: unknown enumerator \"GBP\""},
        {"/items/0/tags", json::Object{},
         "invalid: /items/0/tags: expected JSON array, found JSON object"},
        {"/notes/gift", json::Array{1},
         "missing: /notes/gift/1: missing element (expected JSON array of 2 elements, found 1)"},
        {"/items/1/name", Value(), "missing: /items/1/name: missing member"},
        // The whole string is the name, not the part before a NUL byte.
        {"/items/0/price/currency", std::string("EUR\0junk", 8),
         "invalid: /items/0/price/currency: unknown enumerator \"EUR\\u0000junk\""},
    };
    for (const auto& row : broken) {
        Value document = converted;
        document.at_pointer(row.pointer) = row.replacement;
        EXPECT_EQ(failure<shop::Order>(document), row.message);
    }
    EXPECT_THROW(value_from(static_cast<shop::Currency>(7)), std::invalid_argument);
}

// The JSON text of the Settings that `document` converts to, or the error; `flags` 1 keeps the
// defaults of missing members, 2 refuses unknown members.
std::string settings_or_error(const Value& document, int flags) {
    json::ConvertOptions options;
    options.missing_members_keep_defaults = (flags & 1) != 0;
    options.reject_unknown_members = (flags & 2) != 0;
    std::string text;
    const std::string error = test_support::error_of(
        [&] { text = json::serialize(value_from(value_to<config::Settings>(document, options))); });
    return text.empty() ? error : text;
}

const char* const UNKNOWN = "unknown member (the struct has no member of this name)";

// Each text under each of the four combinations of the two options. Refusing unknown members
// changes nothing where there is none; where there is one, it is refused before any member of
// its struct is converted, so before a missing member is noticed.
TEST(Convert, OptionsForConfigStructs) {
    const struct {
        const char* text;
        std::string plain, keeping_defaults; // without refusing unknown members
        const char* unknown;                 // the unknown member refused, if any
    } rows[] = {
        // A null optional stays null; a missing one is nullopt, or keeps its default.
        {R"({"server":{"host":"a","port":1,"timeout":null},"replicas":[{"host":"b","port":2}],)"
         R"("named":{}})",
         R"({"named":{},"replicas":[{"host":"b","port":2,"timeout":null}],)"
         R"("server":{"host":"a","port":1,"timeout":null}})",
         R"({"named":{},"replicas":[{"host":"b","port":2,"timeout":30}],)"
         R"("server":{"host":"a","port":1,"timeout":null}})",
         nullptr},
        // Missing members, inherited ones among them, inside sequences, maps and tuples.
        {R"({"server":{"host":"a","port":2},"replicas":[{"port":3}],"named":{"n":[{},4]}})",
         "missing: /replicas/0/host: missing member",
         R"({"named":{"n":[{"host":"localhost","port":8080,"timeout":30},4]},)"
         R"("replicas":[{"host":"localhost","port":3,"timeout":30}],)"
         R"("server":{"host":"a","port":2,"timeout":30}})",
         nullptr},
        // Unknown members, in nested structs and at the top; a map's keys are never unknown.
        {R"({"server":{"portt":1},"named":{"any":[{},0]}})",
         "missing: /server/host: missing member",
         R"({"named":{"any":[{"host":"localhost","port":8080,"timeout":30},0]},"replicas":[],)"
         R"("server":{"host":"localhost","port":8080,"timeout":30}})",
         "/server/portt"},
        {R"({"server":{},"replicas":[{},{"a/b":1}],"extra":true})",
         "missing: /server/host: missing member",
         R"({"named":{},"replicas":[{"host":"localhost","port":8080,"timeout":30},)"
         R"({"host":"localhost","port":8080,"timeout":30}],)"
         R"("server":{"host":"localhost","port":8080,"timeout":30}})",
         "/extra"},
        {R"({"server":{"host":"a","port":"80","a/b":1}})",
         "invalid: /server/port: expected JSON number, found JSON string",
         "invalid: /server/port: expected JSON number, found JSON string", "/server/a~1b"},
    };
    for (const auto& row : rows) {
        const Value document = test_support::parsed(row.text);
        for (int flags = 0; flags < 4; ++flags) {
            const std::string expected =
                (flags & 2) != 0 && row.unknown != nullptr
                    ? "invalid: " + std::string(row.unknown) + ": " + UNKNOWN
                : (flags & 1) != 0 ? row.keeping_defaults
                                   : row.plain;
            EXPECT_EQ(settings_or_error(document, flags), expected)
                << row.text << " with options " << flags;
        }
    }
}

TEST(Convert, OptionsThroughValueOrAndUndefinedMembers) {
    Value document = json::Object{{"server", json::Object{{"port", 1}}}};
    const json::ConvertOptions& both = json::CONFIG_RULES;
    const auto server = document.value_or("server", config::Server{}, both);
    EXPECT_EQ(server.host + ":" + std::to_string(server.port), "localhost:1");
    EXPECT_EQ(document.value_or("absent", config::Server{}, both).port, 8080);
    EXPECT_EQ(test_support::error_of([&] { document.value_or("server", config::Server{}); }),
              "missing: /server/host: missing member");
    // A member holding Undefined is absent: neither unknown nor there.
    document.at("server").as_object()["ghost"] = Value();
    document.at("server").as_object()["host"] = Value();
    EXPECT_EQ(document.value_or("server", config::Server{}, both).host, "localhost");
    document.at("server").as_object()["ghost"] = 0;
    EXPECT_EQ(test_support::error_of([&] { document.value_or("server", config::Server{}, both); }),
              std::string("invalid: /server/ghost: ") + UNKNOWN);
}

} // namespace
