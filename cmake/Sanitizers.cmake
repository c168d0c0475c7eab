# QUORELASTIC_SANITIZE names what to build with; an undefined-behaviour report ends the program.
if(QUORELASTIC_SANITIZE)
  add_compile_options(-fsanitize=${QUORELASTIC_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  add_link_options(-fsanitize=${QUORELASTIC_SANITIZE})
  add_compile_definitions(_GLIBCXX_ASSERTIONS QUORELASTIC_SANITIZED)
  # The compilers have different macros for it.
  if(QUORELASTIC_SANITIZE MATCHES "thread")
    add_compile_definitions(QUORELASTIC_SANITIZED_THREADS)
  endif()
endif()
if(QUORELASTIC_LIBFUZZER)
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()
