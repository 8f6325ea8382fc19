#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs a build into a prefix, moves the prefix, and uses it as others do: the command from its
# folder, the examples by find_package and by pkg-config, the man page, the Debian packages.
#   usage: install_test.sh BUILD_FOLDER CMAKE COMPILER GENERATOR
set -euo pipefail
build=$1 cmake=$2 compiler=$3 generator=$4
source=$(cd "$(dirname "$0")/../.." && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cd "$work"
unset ZSI_SHADER_PATH
fail() {
    echo "install_test: $*" >&2
    exit 1
}
# has TEXT FILE: the file has a line with the text.
has() { grep -qF -- "$1" "$2" || fail "$1 is missing in $(cat "$2")"; }
# mean PICTURE [X0-X1,Y0-Y1]: its mean in 8-bit levels.
mean() {
    oiiotool "$1" ${2:+--cut "$2"} --ch R,G,B --printstats |
        awk '/Stats Avg/ {printf "%.0f\n", 255 * ($3 + $4 + $5) / 3 / ($3 > 1 ? 255 : 1)}'
}

"$cmake" --install "$build" --prefix "$work/made" >install.log
mv made moved
prefix=$work/moved
lib=$(dirname "$(find "$prefix" -name libzsi_host.a)")

# The command finds the installed shaders and their description.
zsi=$prefix/bin/zsi
"$zsi" info >classes
[ "$(wc -l <classes)" -eq "$(grep -c '^class ' "$source/tests/data/catalogue.txt")" ] ||
    fail "not all classes: $(cat classes)"
# The Python package below the prefix finds the installed shaders; so does a wheel its own.
count='import zsi; print(len(zsi.classes()), zsi.__file__)'
if [ -d "$build/python" ]; then
    package=$(dirname "$(dirname "$(find "$prefix" -path '*/zsi/_core*.so')")")
    PYTHONPATH=$package /usr/bin/python3 -c "$count" >python.txt
    [ "$(cat python.txt)" = "$(wc -l <classes) $package/zsi/__init__.py" ] || fail "$(cat python.txt)"
    "$cmake" --build "$build" --target wheel >wheel.log || fail "$(cat wheel.log)"
    /usr/bin/python3 -m zipfile -e "$build"/zsi-*.whl wheel
    PYTHONPATH=wheel /usr/bin/python3 -c "$count" >wheel.txt
    [ "$(cat wheel.txt)" = "$(wc -l <classes) $work/wheel/zsi/__init__.py" ] || fail "$(cat wheel.txt)"
    PYTHONPATH=wheel /usr/bin/python3 -m zsi.farm --help >farm.txt || fail "the wheel has no farm"
    farm=farm # finds its package below the prefix
fi
"$zsi" info voSpotLight >spot
has "linear RGB" spot
"$zsi" render "$prefix/share/zsi/scenes/demo.json" -o demo.png --size 32x18 --samples 1 >demo.log
[ -s demo.png ] || fail "no picture of the installed scene"
grep -q corvid_Mtl_Glazing "$prefix/share/zsi/scene.schema.json" || fail "no schema"

# The manual has every option that the command has, and is well-formed.
page=$prefix/share/man/man1/zsi.1
for subcommand in "" info render view schema denoise render-unit merge lab ${farm:-}; do
    "$zsi" $subcommand --help | grep -oE -- '--[a-z][a-z-]*' | sort -u | while read -r option; do
        grep -qF -- "${option//-/\\-}" "$page" || fail "zsi.1: $option is missing"
    done
done
groff -man -Tutf8 -ww -z "$page" 2>page.log
[ ! -s page.log ] || fail "$(cat page.log)"

# The examples, from outside: a shader library, a host, a program over the host library.
configure() { "$cmake" -G "$generator" -DCMAKE_CXX_COMPILER="$compiler" \
    -DCMAKE_BUILD_TYPE=Release -DCMAKE_PREFIX_PATH="$prefix" "$@" >cmake.log 2>&1 ||
    fail "$(cat cmake.log)"; }
configure -S "$prefix/share/doc/zsi-dev/examples" -B examples
grep -q "zsi_DIR:PATH=$lib" examples/CMakeCache.txt || fail "another installation was found"
"$cmake" --build examples --parallel >build.log 2>&1 || fail "$(cat build.log)"
shaders=$(find "$prefix" -name zephyrShaders64.so)
toon=$work/examples/plugin/toonRim.so
tiny=examples/host/tinyHost
# Lit from the upper left; red where told; black where all colours of the toon are.
"$tiny" "$toon" ToonRim toon.ppm color 1 0 0
[ "$(mean toon.ppm 40x40+80+90)" -gt "$(($(mean toon.ppm 40x40+140+160) + 20))" ] ||
    fail "the lit side of the sphere is not the brighter one"
"$tiny" "$toon" ToonRim dark.ppm color 0 0 0
[ "$(mean toon.ppm)" -gt "$(mean dark.ppm)" ] || fail "the parameter changes nothing"
"$tiny" "$shaders" corvid_Mtl_Metal silver.ppm u_reflectColor 1 1 1
"$tiny" "$shaders" corvid_Mtl_Metal grey.ppm u_reflectColor 0.2 0.2 0.2
[ "$(mean silver.ppm)" -gt "$(($(mean grey.ppm) + 10))" ] || fail "silver is no brighter than grey"
for wrong in "$shaders Nothing x.ppm a 1" "$shaders voSpotLight x.ppm range 1" \
    "$toon ToonRim x.ppm color 1" "$work/none.so ToonRim x.ppm color 1 1 1"; do
    ! "$tiny" $wrong 2>tiny.log || fail "tinyHost took $wrong"
    [ "$(wc -l <tiny.log)" -eq 1 ] || fail "tinyHost $wrong: $(cat tiny.log)"
done

path=$(dirname "$toon"):$(dirname "$shaders")
"$zsi" info ToonRim --shader-path "$path" >toon.txt
has "fully lit colour" toon.txt
"$zsi" render "$source/examples/plugin/scene.json" --shader-path "$path" -o toon.png --samples 4 >toon.log
[ "$(mean toon.png 40x40+140+100)" -gt 40 ] || fail "the toon scene is dark"
examples/embed/embed "$(dirname "$shaders")" embed.png >embed.log
[ "$(mean embed.png)" -gt 20 ] || fail "embed.png is dark"

# Whoever writes shaders needs none of the host's libraries.
mkdir contract
cat >contract/CMakeLists.txt <<'PROJECT'
cmake_minimum_required(VERSION 3.25)
project(contract LANGUAGES CXX)
find_package(zsi REQUIRED COMPONENTS contract)
if(TARGET zsi::host OR embree_FOUND)
    message(FATAL_ERROR "more than the contract was found")
endif()
find_package(zsi 2 QUIET)
if(zsi_FOUND)
    message(FATAL_ERROR "another major version was taken")
endif()
PROJECT
configure -S contract -B contract/build

# By pkg-config, and every installed header of the host library.
export PKG_CONFIG_PATH=$lib/pkgconfig
"$compiler" -std=c++20 "$source/examples/host/tinyHost.cpp" $(pkg-config --cflags zsi) -ldl -o tiny
[ -f "$(pkg-config --variable=shaderdir zsi)/zephyrShaders64.so" ] || fail "zsi.pc: shaderdir"
(cd "$prefix/include/zsi-host" && find . -name '*.h' -printf '#include "%P"\n') >all.cpp
cat "$source/examples/embed/embed.cpp" >>all.cpp
"$compiler" -std=c++20 all.cpp $(pkg-config --cflags --libs zsi-host) -o all
./all "$(dirname "$shaders")" all.png >embed.log
cmp embed.png all.png || fail "the program built with pkg-config renders another picture"

# As a part of another project only what that one asks for: no tests, no benchmarks, no install.
mkdir part
cat >part/CMakeLists.txt <<PROJECT
cmake_minimum_required(VERSION 3.25)
project(part LANGUAGES CXX)
add_subdirectory($source zephyr)
if(TARGET test_library OR TARGET kernels OR ZSI_INSTALL OR NOT TARGET zsi::host)
    message(FATAL_ERROR "not what a part should bring")
endif()
PROJECT
configure -S part -B part/build

# Packages: what the programs link to, and what compiling against the library needs.
(cd "$build" && cpack -G DEB -B "$work/deb") >cpack.log 2>&1 || fail "$(cat cpack.log)"
dpkg-deb -f deb/zsi_*.deb Depends >runtime
dpkg-deb -f deb/zsi-dev_*.deb Depends >development
for library in libc6 libstdc++6 libembree3 libopenimageio libassimp libtbb libfmt libelf; do
    has "$library" runtime
done
for package in "zsi (= " libembree-dev libopenimageio-dev libfmt-dev; do
    has "$package" development
done
if [ -d "$build/python" ]; then
    dpkg-deb -f deb/python3-zsi_*.deb Depends >python
    has "python3-numpy" python
    has libembree3 python
fi
dpkg-deb -c deb/zsi_*.deb >content
has ./usr/bin/zsi content
has zephyrShaders64.so content
has /man1/zsi.1 content
dpkg-deb -x deb/zsi_*.deb unpacked
unpacked/usr/bin/zsi info | cmp - classes || fail "the packaged command lists other classes"
! unpacked/usr/bin/zsi farm 2>farm.txt || fail "a farm without its package"
has "python3-zsi" farm.txt
if [ -d "$build/python" ]; then
    dpkg-deb -x deb/python3-zsi_*.deb unpacked
    package=$(dirname "$(dirname "$(find unpacked -name '_core*.so')")")
    PYTHONPATH=$package /usr/bin/python3 -c "$count" >packaged.txt
    has "$(wc -l <classes) " packaged.txt
    unpacked/usr/bin/zsi farm --help >farm.txt
    dpkg-deb -f deb/python3-zsi_*.deb Recommends >python
    has python3-distributed python
fi
