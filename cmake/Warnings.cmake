# Warnings for the project's own targets (third-party sources keep their own flags). They
# become errors only where BRANNOC_WARNINGS_AS_ERRORS is on (the presets and CI), so that
# packagers and newer compilers can still build a plain configuration.
option(BRANNOC_WARNINGS_AS_ERRORS "Treat compiler warnings in the project's code as errors" OFF)

function(brannoc_warnings target)
  target_compile_options(${target} PRIVATE -Wall -Wextra)
  if(BRANNOC_WARNINGS_AS_ERRORS)
    target_compile_options(${target} PRIVATE -Werror)
  endif()
endfunction()
