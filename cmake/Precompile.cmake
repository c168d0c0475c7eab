# The system's headers that many sources include are parsed once for all targets below the given folders, those of the
# index library above all. Such a build does not show whether a source includes what it needs: a build of the preset
# `dev` without QUORELASTIC_PRECOMPILE does.
#
# quorelastic_precompile(HEADER FOLDERS... EXCEPT TARGETS...): every target below FOLDERS but TARGETS gets HEADER.
function(quorelastic_precompile header)
  cmake_parse_arguments(ARG "" "" "EXCEPT" ${ARGN})
  cmake_path(GET header STEM name)
  set(prefix quorelastic_${name}_prefix)
  # Compiled as the targets are: only then is the result accepted.
  set(targets)
  foreach(folder IN LISTS ARG_UNPARSED_ARGUMENTS)
    quorelastic_targets_below("${PROJECT_SOURCE_DIR}/${folder}" below)
    list(APPEND targets ${below})
  endforeach()
  list(GET ARG_UNPARSED_ARGUMENTS 0 first_folder)
  get_property(options DIRECTORY "${PROJECT_SOURCE_DIR}/${first_folder}" PROPERTY COMPILE_OPTIONS)
  add_library(${prefix} OBJECT "${PROJECT_SOURCE_DIR}/cmake/prefix/${name}.cpp")
  set_target_properties(${prefix} PROPERTIES COMPILE_OPTIONS "${options}")
  target_link_libraries(${prefix} PRIVATE quorelastic_lucene PkgConfig::JSONCPP quorelastic_warnings)
  target_precompile_headers(${prefix} PRIVATE "${PROJECT_SOURCE_DIR}/${header}")
  # The macros that the index library and the test framework bring: not every target links both.
  set(macros BOOST_ALL_NO_LIB BOOST_ATOMIC_DYN_LINK BOOST_FILESYSTEM_DYN_LINK BOOST_SYSTEM_DYN_LINK
             BOOST_THREAD_DYN_LINK GTEST_HAS_PTHREAD=1)
  target_compile_definitions(${prefix} PRIVATE ${macros})
  foreach(target IN LISTS targets)
    get_target_property(type ${target} TYPE)
    get_target_property(own_options ${target} COMPILE_OPTIONS)
    if(type MATCHES "EXECUTABLE|(STATIC|SHARED|MODULE|OBJECT)_LIBRARY" AND NOT target IN_LIST ARG_EXCEPT
       AND NOT own_options MATCHES "-fno-sanitize=")
      target_compile_definitions(${target} PRIVATE ${macros})
      target_precompile_headers(${target} REUSE_FROM ${prefix})
    endif()
  endforeach()
endfunction()

function(quorelastic_targets_below folder result)
  get_property(targets DIRECTORY "${folder}" PROPERTY BUILDSYSTEM_TARGETS)
  get_property(folders DIRECTORY "${folder}" PROPERTY SUBDIRECTORIES)
  foreach(inner IN LISTS folders)
    quorelastic_targets_below("${inner}" inner_targets)
    list(APPEND targets ${inner_targets})
  endforeach()
  set(${result} ${targets} PARENT_SCOPE)
endfunction()
