# Every target of this project links quorelastic_warnings: one place says what a warning is.
add_library(quorelastic_warnings INTERFACE)
target_compile_options(
  quorelastic_warnings
  INTERFACE -Wall
            -Wextra
            -Wpedantic
            -Wconversion
            -Wsign-conversion
            -Wshadow
            -Wnon-virtual-dtor
            -Woverloaded-virtual
            -Wold-style-cast
            -Wcast-align
            -Wimplicit-fallthrough
            -Wformat=2
            -Werror)
