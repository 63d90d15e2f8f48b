# The installed libraries, headers, CMake package and pkg-config file.
#
# Tests link the static libraries of each layer, which reach internals; hosts get two shared
# libraries made of the same objects, exporting only what carries LUDMOX_EXPORT:
#   libludmoxreportrt (LudMox::ReportRT): core, the runtime boundary, platform services and
#       the report runtime;
#   libludmox (LudMox::LudMox): the engine, reports, dialogs and automation, over it.

include(CMakePackageConfigHelpers)

set(LUDMOX_REPORTRT_OBJECT_LIBRARIES ludmox_core ludmox_runtime ludmox_platform
    ludmox_reportrt_base ludmox_reportrt_formula ludmox_reportrt_document
    ludmox_reportrt_data ludmox_reportrt_model ludmox_reportrt_layout ludmox_reportrt_mail
    ludmox_reportrt_output ludmox_reportrt_viewer)
set(LUDMOX_COMPONENT_OBJECT_LIBRARIES ludmox_selection ludmox_component ludmox_viewer
    ludmox_automation)

# ludmox_add_shared_library(<target> <output name> <export name> LIBRARIES ... LINK ...)
function(ludmox_add_shared_library target output export)
    cmake_parse_arguments(ARG "" "" "LIBRARIES;LINK" ${ARGN})
    set(objects)
    foreach(library IN LISTS ARG_LIBRARIES)
        list(APPEND objects $<TARGET_OBJECTS:${library}>)
    endforeach()
    add_library(${target} SHARED ${objects})
    # The objects were moc-ed in their own libraries already.
    set_target_properties(${target} PROPERTIES AUTOMOC OFF)
    add_library(LudMox::${export}Shared ALIAS ${target})
    set_target_properties(${target} PROPERTIES
        OUTPUT_NAME ${output} EXPORT_NAME ${export} LINKER_LANGUAGE CXX
        VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR})
    target_include_directories(${target} PUBLIC
        $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/src>
        $<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/include>
        $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>
        $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}/ludmox>)
    # A symbol the objects need but nobody provides fails the link, not the host at load.
    target_link_options(${target} PRIVATE -Wl,--no-undefined)
    target_link_libraries(${target} ${ARG_LINK})
endfunction()

ludmox_add_shared_library(ludmox_reportrt_shared ludmoxreportrt ReportRT
    LIBRARIES ${LUDMOX_REPORTRT_OBJECT_LIBRARIES}
    LINK PUBLIC Qt6::Core Qt6::Gui Qt6::Widgets Qt6::PrintSupport
        PRIVATE Qt6::Sql CURL::libcurl PkgConfig::XLSXWRITER PkgConfig::ODBC SQLite::SQLite3)
ludmox_add_shared_library(ludmox_shared ludmox LudMox
    LIBRARIES ${LUDMOX_COMPONENT_OBJECT_LIBRARIES}
    LINK PUBLIC ludmox_reportrt_shared Qt6::Widgets PRIVATE PkgConfig::XCB)

# Headers a host includes, and the headers they include; nothing private.
set(LUDMOX_PUBLIC_HEADERS
    automation/server.h
    core/collection.h core/comerror.h core/dictionary.h core/eventsource.h core/ludmoxexport.h
    core/object.h core/variant.h
    dialogs/inputboxparams.h dialogs/inputboxparamsitem.h
    engine/moxengine115.h engine/moxservertypes.h
    ludmox/ludmox.h
    reportrt/viewer/registerruntime.h
    reports/enuprintprogress.h reports/moxevents115.h reports/moxreport115.h
    reports/moxreports115.h reports/moxstatus115.h
    viewer/clsmoxviewer115.h viewer/imoxviewer115.h viewer/ludmoxviewerformsdi.h
    viewer/moxviewer115.h)
foreach(header IN LISTS LUDMOX_PUBLIC_HEADERS)
    get_filename_component(folder ${header} DIRECTORY)
    install(FILES ${PROJECT_SOURCE_DIR}/src/${header}
        DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/ludmox/${folder} COMPONENT Development)
endforeach()
install(FILES ${PROJECT_BINARY_DIR}/include/ludmox/version.h
    DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/ludmox/ludmox COMPONENT Development)

install(TARGETS ludmox_reportrt_shared ludmox_shared EXPORT LudMoxTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT Runtime
        NAMELINK_COMPONENT Development)
install(EXPORT LudMoxTargets NAMESPACE LudMox::
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/LudMox COMPONENT Development)
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/LudMoxConfig.cmake.in
    ${PROJECT_BINARY_DIR}/LudMoxConfig.cmake
    INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/LudMox)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/LudMoxConfigVersion.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/LudMoxConfig.cmake
    ${PROJECT_BINARY_DIR}/LudMoxConfigVersion.cmake
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/LudMox COMPONENT Development)

# Relative to the file itself, so a package installed under another prefix (cmake --install
# --prefix, a staging folder) still points at its own headers and libraries.
file(RELATIVE_PATH LUDMOX_PC_PREFIX "${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig"
    "${CMAKE_INSTALL_PREFIX}")
configure_file(${PROJECT_SOURCE_DIR}/cmake/ludmox.pc.in ${PROJECT_BINARY_DIR}/ludmox.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/ludmox.pc
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT Development)

# ludmox_install_program(<target>): installs a program that finds the libraries installed
# beside it, wherever the prefix is.
function(ludmox_install_program target)
    set_target_properties(${target} PROPERTIES INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
    install(TARGETS ${target} RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT Runtime)
endfunction()

# ludmox_add_man_page(<target> <one-line summary>): the program's manual page, made from its
# --help and --version by help2man after each build and installed with it.
find_program(HELP2MAN_PROGRAM help2man)
function(ludmox_add_man_page target summary)
    if(NOT HELP2MAN_PROGRAM)
        message(STATUS "help2man not found: no manual page for ${target}")
        return()
    endif()
    set(page ${CMAKE_CURRENT_BINARY_DIR}/${target}.1)
    add_custom_command(OUTPUT ${page}
        COMMAND ${CMAKE_COMMAND} -E env QT_QPA_PLATFORM=offscreen ASAN_OPTIONS=detect_leaks=0
            ${HELP2MAN_PROGRAM} --no-info --name=${summary}
            --output=${page} $<TARGET_FILE:${target}>
        DEPENDS ${target}
        COMMENT "Writing the manual page of ${target}"
        VERBATIM)
    add_custom_target(${target}_man ALL DEPENDS ${page})
    install(FILES ${page} DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT Runtime)
endfunction()

# The sample database maker and reports, which the command line exports by default.
install(DIRECTORY ${PROJECT_SOURCE_DIR}/examples/reports
    DESTINATION ${CMAKE_INSTALL_DATADIR}/ludmox/examples COMPONENT Runtime)
install(PROGRAMS ${PROJECT_SOURCE_DIR}/examples/make_sample_db.py
    DESTINATION ${CMAKE_INSTALL_DATADIR}/ludmox/examples COMPONENT Runtime)
