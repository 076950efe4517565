# How tests run programs that are built for another processor.

# Seconds that one test may take.
set(QV_TEST_TIMEOUT 300)
if(CMAKE_CROSSCOMPILING_EMULATOR)
  set(QV_TEST_TIMEOUT 1200)
endif()

# qv_get_program(TARGET RESULT): the path under which a script can start the program: the program
# itself, or a launcher that hands it to the emulator.
function(qv_get_program target result)
  if(NOT CMAKE_CROSSCOMPILING_EMULATOR)
    set(${result} $<TARGET_FILE:${target}> PARENT_SCOPE)
    return()
  endif()
  set(launcher ${PROJECT_BINARY_DIR}/launchers/${target})
  set(${result} ${launcher} PARENT_SCOPE)
  get_target_property(has_launcher ${target} QV_HAS_LAUNCHER)
  if(NOT has_launcher)
    list(JOIN CMAKE_CROSSCOMPILING_EMULATOR " " emulator)
    file(GENERATE OUTPUT ${launcher}
         CONTENT "#!/bin/sh\nexec ${emulator} $<TARGET_FILE:${target}> \"$@\"\n"
         FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE)
    set_target_properties(${target} PROPERTIES QV_HAS_LAUNCHER ON)
  endif()
endfunction()
