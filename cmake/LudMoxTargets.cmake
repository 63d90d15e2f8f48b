# Common settings for every library, application and test target of the project.

if(LUDMOX_SANITIZE)
    add_compile_options(-fsanitize=address,undefined -fno-omit-frame-pointer -fno-sanitize-recover=undefined)
    add_link_options(-fsanitize=address,undefined)
endif()

function(ludmox_configure_target target)
    target_compile_definitions(${target} PRIVATE
        QT_NO_CAST_FROM_ASCII QT_NO_CAST_TO_ASCII QT_NO_FOREACH QT_NO_KEYWORDS
        QT_NO_CAST_FROM_BYTEARRAY QT_USE_QSTRINGBUILDER)
    target_compile_options(${target} PRIVATE -Wall -Wextra -Wpedantic -Wshadow
        -Wnon-virtual-dtor -Wold-style-cast -Wcast-align -Woverloaded-virtual)
    # GCC 12 reports std::variant and QString members as "maybe uninitialized" at -O2 where
    # they are not; the warning would only make optimised builds fail at random.
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
        target_compile_options(${target} PRIVATE -Wno-maybe-uninitialized)
    endif()
    if(LUDMOX_WERROR)
        target_compile_options(${target} PRIVATE -Werror)
    endif()
    # Qt's headers dominate the build time on a two-core machine; parse the common ones once
    # per target.
    if(LUDMOX_PRECOMPILED_HEADERS)
        target_precompile_headers(${target} PRIVATE
            <QtCore/QString> <QtCore/QStringList> <QtCore/QList> <QtCore/QDateTime>
            <QtCore/QObject> <memory> <vector> <functional>)
    endif()
endfunction()

# ludmox_add_library(<name> ALIAS <Alias> SOURCES ... PUBLIC_LIBS ... PRIVATE_LIBS ...)
function(ludmox_add_library name)
    cmake_parse_arguments(ARG "" "ALIAS" "SOURCES;PUBLIC_LIBS;PRIVATE_LIBS" ${ARGN})
    add_library(${name} STATIC ${ARG_SOURCES})
    add_library(LudMox::${ARG_ALIAS} ALIAS ${name})
    target_include_directories(${name} PUBLIC
        $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/src>
        $<BUILD_INTERFACE:${PROJECT_BINARY_DIR}/include>)
    target_link_libraries(${name} PUBLIC ${ARG_PUBLIC_LIBS} PRIVATE ${ARG_PRIVATE_LIBS})
    set_target_properties(${name} PROPERTIES POSITION_INDEPENDENT_CODE ON)
    ludmox_configure_target(${name})
endfunction()

# ludmox_add_test(<name> SOURCES ... LIBS ... [ENVIRONMENT ...])
function(ludmox_add_test name)
    cmake_parse_arguments(ARG "" "" "SOURCES;LIBS;ENVIRONMENT" ${ARGN})
    add_executable(${name} ${ARG_SOURCES})
    target_link_libraries(${name} PRIVATE ${ARG_LIBS} GTest::gtest GTest::gmock)
    ludmox_configure_target(${name})
    add_test(NAME ${name} COMMAND ${name})
    set_tests_properties(${name} PROPERTIES
        ENVIRONMENT "QT_QPA_PLATFORM=offscreen;LUDMOX_TEST_DATA=${PROJECT_SOURCE_DIR}/tests/data;${ARG_ENVIRONMENT}"
        TIMEOUT 600)
endfunction()

# ludmox_add_python_test(<name> <script>): a host written in Python, run as CTest test <name>
# with the server, the command line, the examples and the Python client at hand.
function(ludmox_add_python_test name script)
    find_package(Python3 COMPONENTS Interpreter)
    if(NOT Python3_Interpreter_FOUND)
        return()
    endif()
    add_test(NAME ${name} COMMAND ${Python3_EXECUTABLE} ${script} -v)
    set_tests_properties(${name} PROPERTIES
        ENVIRONMENT "QT_QPA_PLATFORM=offscreen;LUDMOX_LUDMOXD=$<TARGET_FILE:ludmoxd>;LUDMOX_CLI=$<TARGET_FILE:ludmox>;LUDMOX_EXAMPLES=${PROJECT_SOURCE_DIR}/examples;PYTHONPATH=${PROJECT_SOURCE_DIR}/python"
        TIMEOUT 300)
endfunction()
