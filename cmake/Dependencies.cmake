# The libraries that the products lean on; the Debian packages that bring them stand in packaging/packages.
find_package(PkgConfig REQUIRED)
pkg_check_modules(LUCENE REQUIRED IMPORTED_TARGET GLOBAL liblucene++)
pkg_check_modules(JSONCPP REQUIRED IMPORTED_TARGET GLOBAL jsoncpp)
pkg_check_modules(XXHASH REQUIRED IMPORTED_TARGET GLOBAL libxxhash)
pkg_check_modules(ICU REQUIRED IMPORTED_TARGET GLOBAL icu-uc)
find_package(ZLIB REQUIRED)
find_package(Boost 1.74 REQUIRED COMPONENTS filesystem system thread)
find_package(Threads REQUIRED)

# The index library and what its headers pull in, as system headers: their warnings are not ours.
add_library(quorelastic_lucene INTERFACE)
target_include_directories(quorelastic_lucene SYSTEM INTERFACE ${LUCENE_INCLUDE_DIRS})
target_link_libraries(quorelastic_lucene INTERFACE PkgConfig::LUCENE Boost::filesystem Boost::system Boost::thread)
# Our public headers include its own.
set_property(TARGET quorelastic_lucene PROPERTY EXPORT_NAME lucene)
install(TARGETS quorelastic_lucene EXPORT quorelastic)

# The daemon's.
find_package(Boost 1.74 REQUIRED COMPONENTS program_options)
find_package(spdlog REQUIRED)
pkg_check_modules(SYSTEMD REQUIRED IMPORTED_TARGET GLOBAL libsystemd)
add_library(quorelastic_asio INTERFACE)
target_link_libraries(quorelastic_asio INTERFACE Boost::headers Threads::Threads)
if(QUORELASTIC_SANITIZE MATCHES "thread")
  # The thread sanitizer knows no fences. The library's queues are locked, so that its fences add nothing for us.
  target_compile_definitions(quorelastic_asio INTERFACE BOOST_ASIO_DISABLE_FENCED_BLOCK)
endif()
