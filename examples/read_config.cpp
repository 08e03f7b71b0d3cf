// Reads a configuration file: fields of each kind, a default, JSON Pointers, a nested struct
// converted both ways, and the errors a wrong document gets.
// Usage: read_config [FILE]   (default: config.json beside this program's sources)
#include <json/json.hpp>

#include <boost/describe.hpp>

#include <fstream>
#include <iostream>
#include <optional>
#include <string>
#include <vector>

namespace catalog {

enum class Unit { piece, kilogram };
BOOST_DESCRIBE_ENUM(Unit, piece, kilogram)

struct Item {
    std::string sku;
    double price;
    Unit unit;
    std::optional<int> stock; // may be missing
    std::vector<std::string> tags;
};
BOOST_DESCRIBE_STRUCT(Item, (), (sku, price, unit, stock, tags))

struct Server {
    std::string host;
    int weight;
};
BOOST_DESCRIBE_STRUCT(Server, (), (host, weight))

struct Catalog {
    std::vector<Item> items;
};
BOOST_DESCRIBE_STRUCT(Catalog, (), (items))

} // namespace catalog

int main(int argc, char** argv) {
    const char* path = argc > 1 ? argv[1] : "config.json";
    std::ifstream file(path);
    json::Value config;
    const json::ParseReport report = json::parse(file, config, json::ParseOptions());
    if (!report) {
        std::cerr << path << ":" << report.line << ":" << report.column << ": " << report.message()
                  << '\n';
        return 1;
    }

    // Fields of each kind, and a default for a field the file leaves out.
    const std::string name = config.at("name").as_string();
    const int port = json::value_to<int>(config.at("port"));
    const bool debug = config.at("debug").as_bool();
    const double ratio = config.at("ratio").as_number();
    const int workers = config.value_or("workers", 4);
    std::cout << std::boolalpha << name << " on port " << port << ", debug " << debug << ", ratio "
              << ratio << ", " << workers << " workers\n";

    // JSON Pointers walk the document; "~1" stands for '/' in a member name.
    std::cout << "first server: " << config.at_pointer("/servers/0/host").as_string() << '\n';
    if (config.find_pointer("/servers/5") == nullptr) {
        std::cout << "no sixth server\n";
    }

    // A nested struct, from JSON and back.
    auto items = json::value_to<catalog::Catalog>(config.at("catalog"));
    items.items[0].price *= 2;
    std::cout << json::serialize(json::value_from(items)) << '\n';

    // Errors say what and where.
    try {
        config.at("servers").at(1).at("port");
    } catch (const std::out_of_range& error) {
        std::cout << "error: " << error.what() << '\n';
    }
    try {
        json::value_to<std::vector<catalog::Server>>(config.at("servers"));
    } catch (const std::invalid_argument& error) {
        std::cout << "error: " << error.what() << '\n';
    }
    try {
        config.at_pointer("/catalog/items/1/price/currency");
    } catch (const std::out_of_range& error) {
        std::cout << "error: " << error.what() << '\n';
    }
}
