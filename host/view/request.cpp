// SPDX-License-Identifier: Apache-2.0
#include "view/request.h"

#include "base/error.h"

#include <algorithm>
#include <boost/asio/ip/address.hpp>
#include <charconv>
#include <fmt/format.h>
#include <sys/random.h>

namespace zsi::view {
namespace {

std::string unescaped(std::string_view text)
{
    std::string plain;
    for (std::size_t i = 0; i < text.size(); ++i) {
        unsigned value = 0;
        if (text[i] == '%' && i + 2 < text.size()
            && std::from_chars(&text[i + 1], &text[i + 1] + 2, value, 16).ptr == &text[i + 1] + 2) {
            plain.push_back(static_cast<char>(value));
            i += 2;
        } else {
            plain.push_back(text[i] == '+' ? ' ' : text[i]);
        }
    }
    return plain;
}

} // namespace

Target parseTarget(std::string_view target)
{
    Target parsed;
    std::size_t const question = target.find('?');
    parsed.path = unescaped(target.substr(0, question));
    while (question != std::string_view::npos && !target.empty()) {
        target.remove_prefix(std::min(target.size(), target.find_first_of("?&") + 1));
        std::string_view const pair = target.substr(0, target.find('&'));
        std::size_t const equals = pair.find('=');
        if (equals != std::string_view::npos)
            parsed.query.emplace_back(unescaped(pair.substr(0, equals)),
                                      unescaped(pair.substr(equals + 1)));
        if (pair.size() == target.size())
            break;
    }
    return parsed;
}

std::string valueOf(Query const& query, std::string_view key)
{
    auto const found = std::find_if(query.begin(), query.end(),
                                    [&](auto const& pair) { return pair.first == key; });
    return found == query.end() ? std::string() : found->second;
}

bool isSameToken(std::string_view given, std::string_view right)
{
    unsigned difference = given.size() != right.size();
    for (std::size_t i = 0; i < right.size(); ++i)
        difference |= static_cast<unsigned char>(right[i])
            ^ static_cast<unsigned char>(i < given.size() ? given[i] : '\0');
    return difference == 0;
}

std::string newToken()
{
    unsigned char bytes[16];
    if (getrandom(bytes, sizeof bytes, 0) != sizeof bytes)
        throw host::InputError("the system gives no random numbers");
    std::string token;
    for (unsigned char const byte : bytes)
        token += fmt::format("{:02x}", byte);
    return token;
}

bool isOwnHost(std::string_view host, unsigned short port)
{
    std::string const end = ':' + std::to_string(port);
    if (!host.ends_with(end))
        return false;
    host.remove_suffix(end.size());
    if (host.starts_with('[') && host.ends_with(']')) {
        host.remove_prefix(1);
        host.remove_suffix(1);
    }
    boost::system::error_code failed;
    boost::asio::ip::make_address(std::string(host), failed);
    return host == "localhost" || !failed;
}

bool isOwnOrigin(std::string_view origin, std::string_view host)
{
    return origin.empty() || origin == "http://" + std::string(host);
}

char const* mimeType(std::string_view path)
{
    struct Type {
        std::string_view ending;
        char const* type;
    };
    constexpr Type kTypes[] = {{".html", "text/html; charset=utf-8"},
                               {".js", "text/javascript; charset=utf-8"},
                               {".css", "text/css; charset=utf-8"},
                               {".svg", "image/svg+xml"},
                               {".png", "image/png"},
                               {".ico", "image/x-icon"},
                               {".woff2", "font/woff2"},
                               {".json", "application/json"},
                               {".txt", "text/plain; charset=utf-8"}};
    for (Type const& type : kTypes)
        if (path.ends_with(type.ending))
            return type.type;
    return "application/octet-stream";
}

} // namespace zsi::view
