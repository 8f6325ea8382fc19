# SPDX-License-Identifier: Apache-2.0
# Run as a script: writes a C++ source with the files of a folder in it.
#   cmake -D FOLDER=page/dist -D OUTPUT=pageFiles.cpp -P embed.cmake
cmake_minimum_required(VERSION 3.25)
set(table "")
set(arrays "")
set(count 0)
if(FOLDER)
    file(GLOB_RECURSE files RELATIVE ${FOLDER} ${FOLDER}/*)
    list(FILTER files EXCLUDE REGEX "\\.(map|LICENSE)$")
    foreach(name IN LISTS files)
        file(READ ${FOLDER}/${name} bytes HEX)
        string(LENGTH "${bytes}" digits)
        math(EXPR size "${digits} / 2")
        string(REGEX REPLACE "(..)" "0x\\1," bytes "${bytes}")
        string(APPEND arrays "constexpr unsigned char kFile${count}[] = {${bytes}0};\n")
        string(APPEND table
            "    {\"${name}\", {reinterpret_cast<char const*>(kFile${count}), ${size}}},\n")
        math(EXPR count "${count} + 1")
    endforeach()
endif()
if(count)
    set(result "    static PageFile const kFiles[] = {\n${table}    };\n    return kFiles;")
else()
    set(result "    return {};")
endif()
file(CONFIGURE OUTPUT ${OUTPUT} CONTENT "// Made by cmake/embed.cmake.
#include \"view/pageFiles.h\"

namespace zsi::view {
namespace {
@arrays@} // namespace

std::span<PageFile const> pageFiles()
{
@result@
}

} // namespace zsi::view
" @ONLY)
