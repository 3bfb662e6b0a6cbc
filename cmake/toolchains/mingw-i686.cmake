# Windows i686, the library's own home. Compiled and linked only: wine32 is not available here.
set(CMAKE_SYSTEM_PROCESSOR i686)
set(UT_MINGW_TRIPLET i686-w64-mingw32)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-common.cmake)
