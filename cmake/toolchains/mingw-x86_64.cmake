# Windows x86_64. CTest runs the test programs through wine64.
set(CMAKE_SYSTEM_PROCESSOR x86_64)
set(UT_MINGW_TRIPLET x86_64-w64-mingw32)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-common.cmake)

set(CMAKE_CROSSCOMPILING_EMULATOR wine)
