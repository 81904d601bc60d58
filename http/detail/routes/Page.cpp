#include "http/detail/routes/Page.hpp"

namespace velkor::http::detail {

std::string_view pageHtml() {
    return "<!DOCTYPE html>\n<html lang=\"en\"><title>velkor</title></html>\n";
}

const std::string& pagePolicy() {
    static const std::string policy = "default-src 'none'";
    return policy;
}

const std::vector<std::pair<std::string, std::string>>& pageHeaders() {
    static const std::vector<std::pair<std::string, std::string>> headers{
        {"Content-Security-Policy", pagePolicy()}};
    return headers;
}

}  // namespace velkor::http::detail
