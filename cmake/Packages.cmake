# `cpack` makes the Debian packages, by packaging/make-packages. CPack's own generator for them is not used: it calls
# ldconfig from scripts, where a trigger is due, and knows no dependencies among the packages that it makes.
set(CPACK_GENERATOR External)
file(CONFIGURE OUTPUT "${PROJECT_BINARY_DIR}/install/cpack.cmake" CONTENT [[
execute_process(COMMAND "@PROJECT_SOURCE_DIR@/packaging/make-packages" "@PROJECT_BINARY_DIR@"
                        "${CPACK_PACKAGE_DIRECTORY}" COMMAND_ERROR_IS_FATAL ANY)
]] @ONLY)
set(CPACK_EXTERNAL_PACKAGE_SCRIPT "${PROJECT_BINARY_DIR}/install/cpack.cmake")
include(CPack)
