// SPDX-License-Identifier: Apache-2.0
/// The one kind of error that bad input leads to.
#pragma once

#include <stdexcept>
#include <string>

namespace zsi::host {

/// Bad input from a user: the message names the file, the place in it and what was expected.
/// Thrown by loaders, caught by the command (exit status 1) and by programs that embed the host.
class InputError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

} // namespace zsi::host
