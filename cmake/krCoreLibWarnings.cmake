# Warnings for the project's own targets; third-party headers come in as
# system headers and stay quiet.
function(kr_set_warnings target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic -Wshadow
                                           -Woverloaded-virtual -Wcast-qual -Wformat=2)
endfunction()
