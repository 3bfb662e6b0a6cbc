# Compiler settings shared by every target of the project.

function(ut_target_defaults target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic)
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
