# SPDX-License-Identifier: MIT
# 32-bit Linux on a 64-bit one: g++ with -m32.
#
# Both widths share the kernel's headers. The package that links them into the compiler's own folders excludes all cross
# compilers, so they are named here.
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR i686)
set(CMAKE_C_COMPILER gcc)
set(CMAKE_CXX_COMPILER g++)
set(CMAKE_C_FLAGS_INIT "-m32 -idirafter /usr/include/x86_64-linux-gnu")
set(CMAKE_CXX_FLAGS_INIT ${CMAKE_C_FLAGS_INIT})
