# Warnings for the project's own targets (third-party sources keep their own flags).
function(brannoc_warnings target)
  target_compile_options(${target} PRIVATE -Wall -Wextra -Werror)
endfunction()
