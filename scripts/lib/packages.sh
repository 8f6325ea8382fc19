# SPDX-License-Identifier: Apache-2.0
# Debian packages of the project, and how the scripts get what is missing. Sourced, not run.

# openimageio-tools: OpenImageIO's CMake package refuses to load without its programs.
# zlib1g-dev: assimp's CMake package links to it without depending on it.
packages_build=(g++ cmake ninja-build libembree-dev libopenimageio-dev openimageio-tools
    libimath-dev libopenexr-dev libtbb-dev libassimp-dev zlib1g-dev nlohmann-json3-dev libcli11-dev
    libfmt-dev libelf-dev libboost-dev pybind11-dev python3-dev python3-numpy)
# Others than Debian's bring npm with Node.
command -v npm >/dev/null || packages_build+=(nodejs npm)
packages_test=(libgtest-dev libbenchmark-dev binutils valgrind pkg-config dpkg-dev file groff-base
    python3-jsonschema python3-pil python3-scipy python3-matplotlib python3-distributed
    mypy chromium chromium-driver python3-selenium)
packages_blender=(blender)
packages_lint=(clang-14 clang-format-14 clang-tidy-14 cppcheck)

# install_missing PACKAGE...: installs those that are not there; sudo only if not root.
install_missing() {
    local missing=() package
    for package in "$@"; do
        dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q '^install ok installed$' ||
            missing+=("$package")
    done
    [ ${#missing[@]} -gt 0 ] || return 0
    echo "Installing: ${missing[*]}"
    local sudo=()
    [ "$(id -u)" -eq 0 ] || sudo=(sudo)
    "${sudo[@]}" apt-get update -qq
    "${sudo[@]}" env DEBIAN_FRONTEND=noninteractive \
        apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
}
