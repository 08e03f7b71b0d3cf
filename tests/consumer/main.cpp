// A program outside the project, built as C++20 against the installed package: std::span
// exists only in C++20, so this also checks that the package leaves the standard to its user.
#include <json/json.hpp>

#include <iostream>
#include <span>

int main() {
    const int numbers[] = {1, 2};
    json::Array list;
    for (const int number : std::span(numbers)) {
        list.push_back(number);
    }
    list.push_back("two");
    json::Object document;
    document["installed"] = true;
    document["list"] = list;
    const std::string text = json::serialize(document);
    std::cout << text << '\n';
    return text == R"({"installed":true,"list":[1,2,"two"]})" ? 0 : 1;
}
