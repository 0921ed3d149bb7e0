# SPDX-License-Identifier: MIT
# Joins the files of the page and writes them as a C++ source with two arrays: what stands before the data of the
# packets, and what stands after them.
#
#   cmake -DFOLDER=cli/page -DSTYLES=a.css -DSCRIPTS=a.js,b.js -DOUT=page.cpp -P embed.cmake

# The policy names style and script by their SHA-256, so that a browser runs nothing else.
function(base64_of_sha256 text result)
    set(alphabet "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/")
    string(SHA256 digits "${text}")
    set(base64 "")
    # Three hexadecimal digits are two of base64; of the 64 one is left, with 4 of the 6 bits.
    foreach(at RANGE 0 60 3)
        string(SUBSTRING "${digits}" ${at} 3 three)
        math(EXPR high "0x${three} >> 6")
        math(EXPR low "0x${three} & 63")
        string(SUBSTRING "${alphabet}" ${high} 1 first)
        string(SUBSTRING "${alphabet}" ${low} 1 second)
        string(APPEND base64 "${first}${second}")
    endforeach()
    string(SUBSTRING "${digits}" 63 1 last)
    math(EXPR last "0x${last} << 2")
    string(SUBSTRING "${alphabet}" ${last} 1 last)
    set(${result} "${base64}${last}=" PARENT_SCOPE)
endfunction()

function(join_files names result)
    string(REPLACE "," ";" names "${names}")
    set(all "")
    foreach(name IN LISTS names)
        file(READ "${FOLDER}/${name}" text)
        string(APPEND all "${text}")
    endforeach()
    if(all MATCHES "</|<!--")
        message(FATAL_ERROR "${names}: '</' and '<!--' would end or change the element around it")
    endif()
    set(${result} "${all}" PARENT_SCOPE)
endfunction()

# A character each, since compilers limit the length of strings.
function(array_of name text result)
    string(HEX "${text}" digits)
    string(REGEX REPLACE "(..)" "'\\\\x\\1'," characters "${digits}")
    set(${result} "constexpr char ${name}[] = {${characters}};\n" PARENT_SCOPE)
endfunction()

join_files("${STYLES}" style)
join_files("${SCRIPTS}" script)
base64_of_sha256("${style}" style_hash)
base64_of_sha256("${script}" script_hash)

file(READ "${FOLDER}/page.html" page)
string(REPLACE "@STYLE_HASH@" "${style_hash}" page "${page}")
string(REPLACE "@SCRIPT_HASH@" "${script_hash}" page "${page}")
string(REPLACE "@STYLE@" "${style}" page "${page}")
string(REPLACE "@SCRIPT@" "${script}" page "${page}")
string(FIND "${page}" "@DATA@" data_at)
if(data_at EQUAL -1)
    message(FATAL_ERROR "page.html has no @DATA@")
endif()
string(SUBSTRING "${page}" 0 ${data_at} start)
math(EXPR data_end "${data_at} + 6")
string(SUBSTRING "${page}" ${data_end} -1 end)

array_of(startText "${start}" start_array)
array_of(endText "${end}" end_array)
file(WRITE "${OUT}" "// Made by embed.cmake.
#include \"page/page.h\"

namespace netfloor::cli {
namespace {
${start_array}${end_array}}

std::string_view pageStart() {
    return {startText, sizeof startText};
}

std::string_view pageEnd() {
    return {endText, sizeof endText};
}

}
")
