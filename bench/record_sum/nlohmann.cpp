// The sum of a field over an array of records with nlohmann/json, one record at a time: its
// parse callback takes each element of the top-level array as it is complete, and returning
// false drops it instead of keeping it in the document. Usage: record_sum_nlohmann FILE
#include <nlohmann/json.hpp>

#include <fstream>
#include <iostream>

int main(int argc, char** argv) {
    std::ifstream in(argc > 1 ? argv[1] : "", std::ios::binary);
    double total = 0;
    const auto each = [&total](int depth, nlohmann::json::parse_event_t event,
                               nlohmann::json& parsed) {
        if (depth == 1 && event == nlohmann::json::parse_event_t::object_end) {
            total += parsed.at("amount").get<double>();
            return false;
        }
        return true;
    };
    try {
        const nlohmann::json dropped = nlohmann::json::parse(in, each); // an empty array
    } catch (const nlohmann::json::parse_error& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
    std::cout << total << '\n';
}
