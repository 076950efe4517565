# How the folders of the tree become targets.

# Compiler settings that every target of the project shares. Below a parent project its flags stay
# as they are, except that no warning here fails its build.
function(qv_set_compile_options target)
  if(PROJECT_IS_TOP_LEVEL OR QV_WARNINGS_AS_ERRORS)
    target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic -Wshadow -Wconversion
                           -Wsign-conversion)
  else()
    target_compile_options(${target} PRIVATE -Wno-error)
  endif()
  if(QV_WARNINGS_AS_ERRORS)
    target_compile_options(${target} PRIVATE -Werror)
  endif()
  if(QV_SANITIZE)
    target_compile_options(${target} PRIVATE -fsanitize=address,undefined
                           -fno-sanitize-recover=all -fno-omit-frame-pointer)
    target_link_options(${target} PUBLIC -fsanitize=address,undefined)
  endif()
endfunction()

# qv_add_folder(NAME FOLDER DEPENDS folder...): the object library qv_NAME of a folder's own sources,
# and its place in QV_FOLDER_TARGETS. The folder includes its own headers, those of its subfolders
# and those of the folders it names; any other include fails the build.
macro(qv_add_folder name folder)
  cmake_parse_arguments(QVF "" "" "DEPENDS" ${ARGN})
  file(GLOB QVF_FILES CONFIGURE_DEPENDS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/*.cpp")
  file(GLOB QVF_HEADERS CONFIGURE_DEPENDS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/*.h")
  set(QVF_STAMP ${CMAKE_CURRENT_BINARY_DIR}/includes-${name}.stamp)
  add_custom_command(
    OUTPUT ${QVF_STAMP}
    COMMAND ${CMAKE_COMMAND} "-DFOLDER=${folder}" "-DALLOWED=${folder};${QVF_DEPENDS}"
            -DSTAMP=${QVF_STAMP} -P ${CMAKE_CURRENT_SOURCE_DIR}/cmake/CheckIncludes.cmake
    DEPENDS ${QVF_FILES} ${QVF_HEADERS} ${CMAKE_CURRENT_SOURCE_DIR}/cmake/CheckIncludes.cmake
    WORKING_DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}
    COMMENT "Checking what ${folder}/ includes"
    VERBATIM)
  if(QVF_FILES)
    add_library(qv_${name} OBJECT ${QVF_FILES} ${QVF_STAMP})
    target_include_directories(qv_${name} PUBLIC ${CMAKE_CURRENT_SOURCE_DIR})
    target_include_directories(qv_${name} SYSTEM PUBLIC ${QV_PLATFORM_INCLUDES})
    set_target_properties(qv_${name} PROPERTIES CXX_VISIBILITY_PRESET hidden
                                                VISIBILITY_INLINES_HIDDEN ON)
    target_compile_options(qv_${name} PRIVATE -fno-exceptions)
    qv_set_compile_options(qv_${name})
    list(APPEND QV_FOLDER_TARGETS qv_${name})
  else()
    add_custom_target(qv_${name} ALL DEPENDS ${QVF_STAMP})
  endif()
endmacro()
