# The system's headers that most sources include, parsed once for all. With QUORELASTIC_PRECOMPILE every target reads
# them so; what is built then tells nothing about whether a source includes what it needs, a build without does.
# `./dev lint` precompiles the same headers for clang-tidy, the way that this target is compiled.
find_package(GTest REQUIRED)
add_library(quorelastic_prefix OBJECT EXCLUDE_FROM_ALL "${PROJECT_SOURCE_DIR}/cmake/prefix.cpp")
target_link_libraries(quorelastic_prefix PRIVATE quorelastic_lucene PkgConfig::JSONCPP GTest::gmock quorelastic_warnings)

function(quorelastic_targets_below folder result)
  get_property(targets DIRECTORY "${folder}" PROPERTY BUILDSYSTEM_TARGETS)
  get_property(folders DIRECTORY "${folder}" PROPERTY SUBDIRECTORIES)
  foreach(inner IN LISTS folders)
    quorelastic_targets_below("${inner}" inner_targets)
    list(APPEND targets ${inner_targets})
  endforeach()
  set(${result} ${targets} PARENT_SCOPE)
endfunction()

if(QUORELASTIC_PRECOMPILE)
  target_precompile_headers(quorelastic_prefix PRIVATE "${PROJECT_SOURCE_DIR}/cmake/prefix.h")
  # What is precompiled is accepted only where each macro that it has looked at is the same: these come with the
  # libraries that it includes, which not every target has.
  set(macros BOOST_ALL_NO_LIB BOOST_ATOMIC_DYN_LINK BOOST_FILESYSTEM_DYN_LINK BOOST_SYSTEM_DYN_LINK
             BOOST_THREAD_DYN_LINK GTEST_HAS_PTHREAD=1)
  quorelastic_targets_below("${PROJECT_SOURCE_DIR}" targets)
  list(REMOVE_ITEM targets quorelastic_prefix)
  foreach(target IN LISTS targets)
    get_target_property(type ${target} TYPE)
    get_target_property(options ${target} COMPILE_OPTIONS)
    # Nor would it be accepted with other options.
    if(type MATCHES "EXECUTABLE|(STATIC|SHARED|OBJECT)_LIBRARY" AND NOT options MATCHES "-fno-sanitize=")
      target_compile_definitions(${target} PRIVATE ${macros})
      target_precompile_headers(${target} REUSE_FROM quorelastic_prefix)
    endif()
  endforeach()
endif()
