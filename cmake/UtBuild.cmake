# Compiler settings shared by every target of the project.

function(ut_target_defaults target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic -Werror)
  if(UT_SANITIZE)
    target_compile_options(${target} PRIVATE -fsanitize=${UT_SANITIZE} -fno-omit-frame-pointer
                                             -fno-sanitize-recover=all)
    target_link_options(${target} PRIVATE -fsanitize=${UT_SANITIZE})
  endif()
  if(MINGW)
    # One C++ runtime inside each module: nothing to ship beside the DLLs, and wine needs no path.
    target_link_options(${target} PRIVATE -static-libgcc -static-libstdc++ -static)
  endif()
endfunction()
