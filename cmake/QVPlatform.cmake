# What the platform supplies and what stands in for it: the one place that tells Android from
# everything else. Sets
#   QV_PLATFORM_INCLUDES   folders of <android/log.h> and <utils/Vector.h>
#   QV_PLATFORM_LIBRARIES  what the shared library links for them
#   QV_PLATFORM_HEADERS    stand-in headers that programs using the library need
#   QV_PLATFORM_STANDIN    whether Platform/ is compiled into the library
#   QV_PLATFORM_EXPORTS    classes that are exported off Android only
# On Android the log is the system's liblog. The vector is that of libutils where a platform tree
# supplies it (QV_LIBUTILS_INCLUDE_DIR and QV_LIBUTILS_LIBRARY); the NDK does not, and there the
# stand-in serves.
if(ANDROID)
  set(QV_LIBUTILS_INCLUDE_DIR "" CACHE PATH "Folder of the platform's <utils/Vector.h>")
  set(QV_LIBUTILS_LIBRARY "" CACHE FILEPATH "The platform's libutils")
  set(QV_PLATFORM_STANDIN OFF)
  set(QV_PLATFORM_LIBRARIES log)
  set(QV_PLATFORM_HEADERS "")
  set(QV_PLATFORM_EXPORTS "")
  if(QV_LIBUTILS_INCLUDE_DIR)
    set(QV_PLATFORM_INCLUDES ${QV_LIBUTILS_INCLUDE_DIR})
    list(APPEND QV_PLATFORM_LIBRARIES ${QV_LIBUTILS_LIBRARY})
  else()
    # A folder of its own, so that the stand-in log does not hide the system's.
    set(QV_PLATFORM_INCLUDES ${PROJECT_BINARY_DIR}/platform)
    configure_file(Platform/utils/Vector.h ${PROJECT_BINARY_DIR}/platform/utils/Vector.h COPYONLY)
    set(QV_PLATFORM_HEADERS utils/Vector.h)
  endif()
else()
  set(QV_PLATFORM_STANDIN ON)
  set(QV_PLATFORM_INCLUDES ${PROJECT_SOURCE_DIR}/Platform)
  set(QV_PLATFORM_LIBRARIES "")
  set(QV_PLATFORM_HEADERS utils/Vector.h)
  set(QV_PLATFORM_EXPORTS "CDataPaths::*; CLogSink::*;")
endif()
