# The target `docs`: the reference of the public headers, which fails on anything undocumented.
find_package(Doxygen QUIET)
if(NOT DOXYGEN_FOUND)
  message(STATUS "Doxygen is not installed: no reference")
  return()
endif()
find_package(Python3 REQUIRED COMPONENTS Interpreter)

set(QV_DOXYGEN_INPUT ${QV_PUBLIC_HEADERS} bindings/c/qvlocalize.h)
list(TRANSFORM QV_DOXYGEN_INPUT PREPEND "${CMAKE_CURRENT_SOURCE_DIR}/")
list(JOIN QV_DOXYGEN_INPUT " " QV_DOXYGEN_INPUT)
configure_file(docs/Doxyfile.in ${PROJECT_BINARY_DIR}/Doxyfile @ONLY)
add_custom_target(docs COMMAND ${DOXYGEN_EXECUTABLE} ${PROJECT_BINARY_DIR}/Doxyfile
                  COMMENT "Making the reference of the public headers" VERBATIM)
