// Builds a small document from Values and writes it compact and pretty.
#include <json/json.hpp>

#include <iostream>

int main() {
    json::Object address;
    address["city"] = "Lisbon";
    address["zip"] = "1100-148";

    json::Object person;
    person["name"] = "Ada";
    person["age"] = 36;
    person["height"] = 1.68;
    person["admin"] = true;
    person["manager"] = nullptr;
    person["address"] = address;
    person["tags"] = json::Array{"math", "engines"};
    person["projects"] = json::Array{};

    const json::Value document = person;
    std::cout << json::serialize(document) << "\n\n" << json::pretty_print(document) << '\n';
}
