# QUORELASTIC_SANITIZE names what to build with; an undefined-behaviour report ends the program.
if(QUORELASTIC_SANITIZE)
  add_compile_options(-fsanitize=${QUORELASTIC_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  add_link_options(-fsanitize=${QUORELASTIC_SANITIZE})
  add_compile_definitions(_GLIBCXX_ASSERTIONS)
endif()
if(QUORELASTIC_LIBFUZZER)
  add_compile_options(-fsanitize=fuzzer-no-link)
endif()
