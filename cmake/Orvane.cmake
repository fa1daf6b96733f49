# Helpers shared by the project's CMake files.

# orvane_warnings(target): our warning set on one target.
function(orvane_warnings target)
  target_compile_options(${target} PRIVATE ${ORVANE_WARNINGS})
endfunction()
