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

# qv_add_folder(NAME FOLDER [SOURCES file...] [EXCEPT file...]): the object library qv_NAME of a
# folder's sources (all of them, or those named), and its place in QV_FOLDER_TARGETS.
macro(qv_add_folder name folder)
  cmake_parse_arguments(QVF "" "" "SOURCES;EXCEPT" ${ARGN})
  if(QVF_SOURCES)
    set(QVF_FILES ${QVF_SOURCES})
    list(TRANSFORM QVF_FILES PREPEND "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/")
  else()
    file(GLOB QVF_FILES CONFIGURE_DEPENDS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/*.cpp")
    foreach(QVF_FILE ${QVF_EXCEPT})
      list(REMOVE_ITEM QVF_FILES "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/${QVF_FILE}")
    endforeach()
  endif()
  if(NOT QVF_FILES)
    set(QVF_FILES ${CMAKE_CURRENT_SOURCE_DIR}/cmake/NotYet.cpp)
  endif()
  add_library(qv_${name} OBJECT ${QVF_FILES})
  target_include_directories(qv_${name} PUBLIC ${CMAKE_CURRENT_SOURCE_DIR})
  target_include_directories(qv_${name} SYSTEM PUBLIC ${QV_PLATFORM_INCLUDES})
  set_target_properties(qv_${name} PROPERTIES CXX_VISIBILITY_PRESET hidden
                                              VISIBILITY_INLINES_HIDDEN ON)
  target_compile_options(qv_${name} PRIVATE -fno-exceptions)
  qv_set_compile_options(qv_${name})
  list(APPEND QV_FOLDER_TARGETS qv_${name})
endmacro()
