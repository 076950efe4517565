# What `cmake --install` puts where: the library, the headers of its interface, what other builds
# find it by, the tool with its manual page and completions, and the pinyin table.
include(CMakePackageConfigHelpers)

# The interface. Headers that are not listed here serve the library's own sources alone.
set(QV_PUBLIC_HEADERS
    Common/CommonQsort.h
    Common/DataPaths.h
    Common/Export.h
    Common/FileHelpers.h
    Common/NumberText.h
    Common/SystemTime.h
    Common/Utf8.h
    Common/WideString.h
    Core/ContactRecords.h
    Core/LocalizerCodes.h
    Core/LocalizerLogic.h
    Core/SearchRecords.h
    Core/Records/ContactRecords.h
    Core/Records/LocalizerCodes.h
    Core/Records/SearchRecords.h
    DBOperator/DBOperator.h
    DBOperator/DBOperatorFactory.h
    DBOperator/SQLiteOperator.h
    Filter/AccountExpandFilterProcess.h
    Filter/AccountFilterProcess.h
    Filter/ContactIdExpandFilterProcess.h
    Filter/FavouritesFilterProcess.h
    Filter/Filter.h
    Filter/FilterChain.h
    Filter/FilterProcess.h
    Filter/FilterProcessFactory.h
    Filter/GroupExpandFilterProcess.h
    Filter/GroupFilterProcess.h
    Filter/MailFilterProcess.h
    Filter/OnlineFilterProcess.h
    Filter/PhoneFilterProcess.h
    Filter/PostalFilterProcess.h
    LocalizerImpl/NameFolding.h
    LocalizerImpl/QVLocalizerManager.h
    LocalizerImpl/QVNumLocalizerManager.h
    LocalizerImpl/QVWordLocalizerManager.h
    LocalizerImpl/Syllables.h
    MemManager/MemManger.h
    MemManager/ShareMemory.h
    MemManager/SingleMutex.h
    MemManager/SpecialNumbers.h
    MemManager/Files/ShareMemory.h
    MemManager/Files/SingleMutex.h)
if(QV_PLATFORM_STANDIN)
  list(APPEND QV_PUBLIC_HEADERS Platform/LogSink.h)
endif()

set(QV_INSTALL_HEADERS ${CMAKE_INSTALL_INCLUDEDIR}/QV_Localize)
set(QV_INSTALL_PACKAGE ${CMAKE_INSTALL_LIBDIR}/cmake/QV_Localize)

install(TARGETS QV_Localize EXPORT QV_LocalizeTargets LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
foreach(header ${QV_PUBLIC_HEADERS})
  get_filename_component(folder ${header} DIRECTORY)
  install(FILES ${header} DESTINATION ${QV_INSTALL_HEADERS}/${folder})
endforeach()
foreach(header ${QV_PLATFORM_HEADERS})
  get_filename_component(folder ${header} DIRECTORY)
  install(FILES Platform/${header} DESTINATION ${QV_INSTALL_HEADERS}/${folder})
endforeach()

install(EXPORT QV_LocalizeTargets NAMESPACE QV_Localize:: DESTINATION ${QV_INSTALL_PACKAGE})
configure_package_config_file(cmake/QV_LocalizeConfig.cmake.in
                              ${PROJECT_BINARY_DIR}/QV_LocalizeConfig.cmake
                              INSTALL_DESTINATION ${QV_INSTALL_PACKAGE}
                              PATH_VARS CMAKE_INSTALL_DATADIR)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/QV_LocalizeConfigVersion.cmake
                                 COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/QV_LocalizeConfig.cmake
              ${PROJECT_BINARY_DIR}/QV_LocalizeConfigVersion.cmake
        DESTINATION ${QV_INSTALL_PACKAGE})

# The .pc file names its folders relative to its own place, so that the installed tree can move.
file(RELATIVE_PATH QV_PC_PREFIX /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
configure_file(cmake/QV_Localize.pc.in ${PROJECT_BINARY_DIR}/QV_Localize.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/QV_Localize.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

install(FILES ${PROJECT_BINARY_DIR}/data/pyfile.bin DESTINATION ${CMAKE_INSTALL_DATADIR}/QV_Localize)
install(FILES LICENSE NOTICE DESTINATION ${CMAKE_INSTALL_DOCDIR})
if(QV_BUILD_TOOL)
  install(TARGETS qvlocalize RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
  install(PROGRAMS tools/import_contacts.py DESTINATION ${CMAKE_INSTALL_DATADIR}/QV_Localize)
  install(FILES tools/qvlocalize.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1)
  install(FILES tools/completion/qvlocalize.bash RENAME qvlocalize
          DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions)
  install(FILES tools/completion/_qvlocalize
          DESTINATION ${CMAKE_INSTALL_DATADIR}/zsh/site-functions)
endif()
