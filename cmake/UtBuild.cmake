# Compiler settings shared by every target of the project.

function(ut_target_defaults target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic)
  # A library's calls to its own exported functions go straight to them, not through the PLT, and
  # can be inlined: nothing is meant to interpose them.
  target_compile_options(${target} PRIVATE -fno-semantic-interposition)
  get_target_property(type ${target} TYPE)
  if(type STREQUAL "SHARED_LIBRARY" AND NOT WIN32)
    target_link_options(${target} PRIVATE -Wl,-Bsymbolic-functions)
  endif()
  if(UT_WERROR)
    target_compile_options(${target} PRIVATE -Werror)
  endif()
  if(UT_SANITIZE)
    target_compile_options(${target} PRIVATE -fsanitize=${UT_SANITIZE} -fno-omit-frame-pointer
                                             -fno-sanitize-recover=all)
    target_link_options(${target} PRIVATE -fsanitize=${UT_SANITIZE})
  endif()
  if(MINGW)
    # The library's own view of <windows.h>; plug-ins keep theirs whole.
    target_compile_definitions(${target} PRIVATE NOMINMAX WIN32_LEAN_AND_MEAN)
    # One C++ runtime inside each module: nothing to ship beside the DLLs, and wine needs no path.
    target_link_options(${target} PRIVATE -static-libgcc -static-libstdc++ -static)
  endif()
endfunction()

# A command that runs the tests' programs, such as valgrind; empty runs them as they are (under the
# toolchain's emulator when cross-compiling).
set(UT_TEST_LAUNCHER "" CACHE STRING "Command list that runs each test program")

# ut_add_program_test(name target [args...]): a CTest test that runs a program target.
function(ut_add_program_test name target)
  if(UT_TEST_LAUNCHER)
    add_test(NAME ${name} COMMAND ${UT_TEST_LAUNCHER} $<TARGET_FILE:${target}> ${ARGN})
  else()
    add_test(NAME ${name} COMMAND ${target} ${ARGN})
  endif()
endfunction()

# ut_use_header_library(target folder...): libraries of headers only, found on the build machine
# under /usr/include/<folder>, as private include folders (nothing of them reaches the installed
# package). Natively through their CMake packages; when cross-compiling through a build-tree
# folder of links to them that holds nothing else, so that no other header of the build machine
# reaches the cross compiler.
set(UT_HEADER_LIBRARY_nlohmann nlohmann_json nlohmann_json::nlohmann_json)
set(UT_HEADER_LIBRARY_CLI CLI11 CLI11::CLI11)
function(ut_use_header_library target)
  if(CMAKE_CROSSCOMPILING)
    set(links ${CMAKE_BINARY_DIR}/header-libraries)
    file(MAKE_DIRECTORY ${links})
    foreach(folder ${ARGN})
      if(NOT EXISTS /usr/include/${folder})
        message(FATAL_ERROR "/usr/include/${folder} is missing: ./run deps installs it")
      endif()
      if(NOT EXISTS ${links}/${folder})
        file(CREATE_LINK /usr/include/${folder} ${links}/${folder} SYMBOLIC)
      endif()
    endforeach()
    target_include_directories(${target} SYSTEM PRIVATE ${links})
  else()
    foreach(folder ${ARGN})
      list(GET UT_HEADER_LIBRARY_${folder} 0 package)
      list(GET UT_HEADER_LIBRARY_${folder} 1 imported)
      find_package(${package} REQUIRED)
      target_include_directories(${target} SYSTEM PRIVATE
                                 $<TARGET_PROPERTY:${imported},INTERFACE_INCLUDE_DIRECTORIES>)
    endforeach()
  endif()
endfunction()
