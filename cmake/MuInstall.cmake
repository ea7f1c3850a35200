# What `cmake --install` lays out: the libraries, their headers below include/mu_common (so that include lines read as
# they do here), the CMake package, the pkg-config file, message catalogues, the documents with the examples that they
# speak of, and tav with its manual page and completions.
#
# A host that brings its own platform (MU_COMMON_PLATFORM) gets none from here: its package names no platform, and its
# users link theirs beside mu_common::mu_common.
include(CMakePackageConfigHelpers)
include(MuCatalogue)

set(MU_INSTALL_INCLUDEDIR "${CMAKE_INSTALL_INCLUDEDIR}/mu_common")
set(MU_INSTALL_CMAKEDIR "${CMAKE_INSTALL_LIBDIR}/cmake/mu_common")

set(libraries mu_common_library)
set(headers ${MU_COMMON_HEADERS})
set(MU_PC_LIBS "-lmu_common")
if(NOT MU_COMMON_PLATFORM)
    list(APPEND libraries mu_platform)
    list(APPEND headers ${MU_PLATFORM_HEADERS})
    string(APPEND MU_PC_LIBS " -lmu_platform")
endif()

foreach(library IN LISTS libraries)
    target_include_directories(${library} INTERFACE "$<INSTALL_INTERFACE:${MU_INSTALL_INCLUDEDIR}>")
    set_property(TARGET ${library} PROPERTY INSTALL_RPATH "$ORIGIN")
endforeach()
install(TARGETS ${libraries} EXPORT mu_commonTargets LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}")

foreach(header IN LISTS headers)
    get_filename_component(folder "${header}" DIRECTORY)
    install(FILES "${PROJECT_SOURCE_DIR}/${header}" DESTINATION "${MU_INSTALL_INCLUDEDIR}/${folder}")
endforeach()

# The pictures of drawings come as a package of their own, for programs that want nothing else.
target_include_directories(mu_preview_library INTERFACE "$<INSTALL_INTERFACE:${MU_INSTALL_INCLUDEDIR}>")
install(TARGETS mu_preview_library EXPORT mu_previewTargets LIBRARY DESTINATION "${CMAKE_INSTALL_LIBDIR}")
install(FILES ${MU_PREVIEW_HEADERS} DESTINATION "${MU_INSTALL_INCLUDEDIR}/preview")
install(EXPORT mu_previewTargets NAMESPACE mu_preview:: FILE mu_previewConfig.cmake
    DESTINATION "${CMAKE_INSTALL_LIBDIR}/cmake/mu_preview")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/package/mu_previewConfigVersion.cmake"
    COMPATIBILITY SameMinorVersion)
install(FILES "${PROJECT_BINARY_DIR}/package/mu_previewConfigVersion.cmake"
    DESTINATION "${CMAKE_INSTALL_LIBDIR}/cmake/mu_preview")

install(EXPORT mu_commonTargets NAMESPACE mu_common:: DESTINATION "${MU_INSTALL_CMAKEDIR}")
configure_package_config_file("${PROJECT_SOURCE_DIR}/cmake/mu_commonConfig.cmake.in"
    "${PROJECT_BINARY_DIR}/package/mu_commonConfig.cmake"
    INSTALL_DESTINATION "${MU_INSTALL_CMAKEDIR}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/package/mu_commonConfigVersion.cmake"
    COMPATIBILITY SameMinorVersion)
install(FILES
    "${PROJECT_BINARY_DIR}/package/mu_commonConfig.cmake"
    "${PROJECT_BINARY_DIR}/package/mu_commonConfigVersion.cmake"
    DESTINATION "${MU_INSTALL_CMAKEDIR}")

file(RELATIVE_PATH MU_PC_PREFIX "/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/")
foreach(package IN ITEMS mu_common mu_preview)
    configure_file("${PROJECT_SOURCE_DIR}/cmake/${package}.pc.in" "${PROJECT_BINARY_DIR}/package/${package}.pc" @ONLY)
    install(FILES "${PROJECT_BINARY_DIR}/package/${package}.pc" DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
endforeach()

file(GLOB catalogues CONFIGURE_DEPENDS "${PROJECT_SOURCE_DIR}/po/*.po")
foreach(catalogue IN LISTS catalogues)
    get_filename_component(language "${catalogue}" NAME_WE)
    set(folder "${language}/LC_MESSAGES")
    mu_catalogue(catalogue_${language} "${catalogue}" "${PROJECT_BINARY_DIR}/locale/${folder}/mu_common.mo")
    install(FILES "${PROJECT_BINARY_DIR}/locale/${folder}/mu_common.mo"
        DESTINATION "${CMAKE_INSTALL_LOCALEDIR}/${folder}")
endforeach()

# In the folders that links in the documents expect.
foreach(document IN ITEMS README CHANGELOG SECURITY CONTRIBUTING)
    install(FILES "${PROJECT_SOURCE_DIR}/${document}.md" DESTINATION "${CMAKE_INSTALL_DOCDIR}")
endforeach()
install(DIRECTORY "${PROJECT_SOURCE_DIR}/docs/" DESTINATION "${CMAKE_INSTALL_DOCDIR}/docs"
    FILES_MATCHING PATTERN "*.md" PATTERN man EXCLUDE PATTERN design EXCLUDE)
install(FILES "${PROJECT_SOURCE_DIR}/examples/first_look.cpp" "${PROJECT_SOURCE_DIR}/examples/editor.cpp"
    DESTINATION "${CMAKE_INSTALL_DOCDIR}/examples")
install(DIRECTORY "${PROJECT_SOURCE_DIR}/examples/consumer" "${PROJECT_SOURCE_DIR}/examples/preview"
    DESTINATION "${CMAKE_INSTALL_DOCDIR}/examples")

if(TARGET tav)
    file(RELATIVE_PATH bin_to_lib "/${CMAKE_INSTALL_BINDIR}" "/${CMAKE_INSTALL_LIBDIR}")
    set_property(TARGET tav PROPERTY INSTALL_RPATH "$ORIGIN/${bin_to_lib}")
    install(TARGETS tav RUNTIME DESTINATION "${CMAKE_INSTALL_BINDIR}")
    install(FILES "${PROJECT_SOURCE_DIR}/docs/man/tav.1" DESTINATION "${CMAKE_INSTALL_MANDIR}/man1")
    # Each shell looks for completions in a folder of its own, by the name of the command.
    set(completion "${PROJECT_SOURCE_DIR}/host/completion")
    install(FILES "${completion}/tav.bash"
        DESTINATION "${CMAKE_INSTALL_DATADIR}/bash-completion/completions" RENAME tav)
    install(FILES "${completion}/_tav" DESTINATION "${CMAKE_INSTALL_DATADIR}/zsh/site-functions")
    install(FILES "${completion}/tav.fish" DESTINATION "${CMAKE_INSTALL_DATADIR}/fish/vendor_completions.d")
endif()
