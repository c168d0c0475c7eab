# What is shipped makes an attack on a mistake harder, and shows nothing of the folder it was built in. The sanitizers
# find the mistakes, and go without. -fcf-protection is left out: nothing on Debian 12 heeds the marks that it leaves.
include(CheckPIESupported)
check_pie_supported(LANGUAGES CXX)
add_link_options(-Wl,-z,noexecstack -Wl,-z,relro -Wl,-z,now -Wl,--as-needed)

if(CMAKE_BUILD_TYPE STREQUAL "Release" AND NOT QUORELASTIC_SANITIZE)
  add_compile_options(-fstack-protector-strong -fstack-clash-protection -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=3)
  # Of two maps that fit, the last one holds.
  add_compile_options("-ffile-prefix-map=${PROJECT_SOURCE_DIR}=." "-ffile-prefix-map=${PROJECT_BINARY_DIR}=./build")
endif()

# Programs find the build's own libraries from where they stand themselves: the length of another path would be left in
# them when they are installed.
set(CMAKE_BUILD_RPATH_USE_ORIGIN ON)
