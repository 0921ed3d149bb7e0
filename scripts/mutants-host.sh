#!/bin/bash
# SPDX-License-Identifier: MIT
# Changes the host, the capture library and the command in some 9,600 places, one at a time, and counts the changes that
# command lines or tests notice. All changes are compiled into one build, and one is chosen at run time. Tables are changed
# in memory. Names each that is not noticed, but those of which tests/mutation/host_explained.txt says why. Fails
# where they are too many. build/mutants-host/report.txt has a line for each change as soon as it is known what notices it.
#
#   scripts/mutants-host.sh [EVERY]    each EVERY-th change, 41
set -euo pipefail
cd "$(dirname "$0")/.."
work=build/mutants-host
tree=$work/tree
least=80 # of a hundred changes
folders=(host analysis capture columns cli)
tests=(test_host test_analysis test_capture test_columns test_cli)
captures=$PWD/tests/captures

ninja -C build netfloor | sed '/no work to do/d'
sources=$(find "${folders[@]}" "${tests[@]/#test_/tests/}" tests/support tests/mutation include cmake -type f -print0 | sort -z | xargs -0 cat |
    sha256sum)
if [ "$(cat $work/sources 2>/dev/null)" != "$sources" ]; then
    rm -rf $work
    mkdir -p $tree/plugin $tree/build/host $tree/build/plugin
    cp -r CMakeLists.txt README.md docs cmake include tests "${folders[@]}" $tree
    cp -r build/host/include $tree/build/host # the number of the version
    /usr/bin/python3 tests/mutation/rewrite_host.py $tree
    # The plug-in is as it is.
    printf '%s\n' 'add_library(netfloor SHARED IMPORTED GLOBAL)' \
        "set_target_properties(netfloor PROPERTIES IMPORTED_LOCATION \${CMAKE_CURRENT_BINARY_DIR}/libnetfloor.so)" \
        >$tree/plugin/CMakeLists.txt
    # shellcheck disable=SC2016 # for CMake
    printf '%s\n' 'target_link_libraries(netfloor_warnings INTERFACE netfloor_mutants)' \
        'target_include_directories(netfloor_warnings INTERFACE ${PROJECT_SOURCE_DIR}/tests/mutation)' >>$tree/CMakeLists.txt
    # The rewritten sources are not optimised, and what the rewriting adds is not warned of.
    for folder in "${folders[@]}" tests; do
        sed -i '1i add_compile_options(-O0 -U_FORTIFY_SOURCE -w -Wno-c++11-narrowing)' $tree/$folder/CMakeLists.txt
    done
    sed -i 's/-D_FORTIFY_SOURCE=2//; s/-U_FORTIFY_SOURCE\$<SEMICOLON>//' $tree/cmake/NetfloorBuild.cmake
    CC=clang CXX=clang++ cmake -S $tree -B $tree/build -G Ninja -DCMAKE_BUILD_TYPE=Release -DNETFLOOR_TESTS=ON -DNETFLOOR_BENCH=OFF \
        -DNETFLOOR_INSTALL=OFF >$work/log
    ninja -C $tree/build -j 2 netfloor_command "${tests[@]}" >$work/log || { tail -n 40 $work/log; exit 1; }
    echo "$sources" >$work/sources
fi
cp build/plugin/libnetfloor.so $tree/build/plugin/
exec /usr/bin/python3 tests/mutation/run_host_mutants.py $tree "$captures" tests/mutation/host_explained.txt "${1:-41}" $least $work/report.txt
