// SPDX-License-Identifier: Apache-2.0
/// What a request is allowed and what it asks for.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace zsi::view {

/// Keys and values in the order of the address.
using Query = std::vector<std::pair<std::string, std::string>>;
std::string valueOf(Query const& query, std::string_view key); ///< empty: not there

/// The part of an address behind the host: "/picture.png?token=..." without its escapes.
struct Target {
    std::string path; ///< begins with /
    Query query;
};
Target parseTarget(std::string_view target);

/// Takes as long for any wrong token as for the right one.
bool isSameToken(std::string_view given, std::string_view right);
/// 32 hexadecimal digits that nobody can guess.
std::string newToken();

/// Whether a request's Host is this server under a name that no other site can take: an address,
/// or localhost. Against pages whose own name is made to lead here.
bool isOwnHost(std::string_view host, unsigned short port);
/// Whether an Origin is that of this server's page; requests that are no page's have none.
bool isOwnOrigin(std::string_view origin, std::string_view host);

char const* mimeType(std::string_view path);

} // namespace zsi::view
