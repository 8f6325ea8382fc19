// SPDX-License-Identifier: Apache-2.0
/// Error messages of the host, as tests look at them.
#pragma once

#include "base/error.h"

#include <gtest/gtest.h>
#include <string>
#include <vector>

namespace zsi::test {

std::string errorOf(auto&& action)
{
    try {
        action();
    } catch (host::InputError const& error) {
        return error.what();
    }
    return "no error";
}

inline void expectContains(std::string const& message, std::vector<std::string> const& parts)
{
    for (std::string const& part : parts)
        EXPECT_NE(message.find(part), std::string::npos) << '"' << part << "\" in: " << message;
}

} // namespace zsi::test
