// Builds a nested document with the builders alone and writes it pretty.
#include <json/json.hpp>

#include <iostream>

int main() {
    using json::Element;
    using json::Property;

    const json::Value team =
        (Property("name") = "Analytical Engines", Property("founded") = 1837,
         Property("budget") = 12500.75, Property("active") = true,
         Property("address") = (Property("city") = "London", Property("street") = "Dorset St",
                                Property("number") = 1),
         Property("members") =
             (Element((Property("name") = "Ada", Property("role") = "analyst")),
              Element((Property("name") = "Charles", Property("role") = "designer"))),
         Property("open_issues") = json::Array{});

    std::cout << json::pretty_print(team) << '\n';
}
