// SPDX-License-Identifier: Apache-2.0
/// A folder that goes when the test ends.
#pragma once

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <stdlib.h>
#include <string>

namespace zsi::test {

class TemporaryFolder {
public:
    TemporaryFolder()
    {
        std::string name = std::filesystem::temp_directory_path() / "zsi-test-XXXXXX";
        if (!mkdtemp(name.data()))
            throw std::runtime_error("cannot make a temporary folder");
        path = name;
    }
    TemporaryFolder(TemporaryFolder const&) = delete;
    TemporaryFolder& operator=(TemporaryFolder const&) = delete;
    ~TemporaryFolder()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }

    /// Writes a file of the folder and returns its path.
    std::filesystem::path write(std::string const& name, std::string const& content) const
    {
        std::ofstream(path / name, std::ios::binary) << content;
        return path / name;
    }

    std::filesystem::path path;
};

} // namespace zsi::test
