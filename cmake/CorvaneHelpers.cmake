# The one place that knows compiler settings and what a library, a test, a benchmark or a fuzz
# target of this project is made of.

include_guard(GLOBAL)
include(CheckCXXCompilerFlag)

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_POSITION_INDEPENDENT_CODE ON)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin")
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin")

find_program(CCACHE_PROGRAM ccache)
if(CCACHE_PROGRAM)
  # It takes precompiled headers only if told that these settle what a file defines.
  set(CMAKE_CXX_COMPILER_LAUNCHER
    "${CMAKE_COMMAND}" -E env CCACHE_SLOPPINESS=pch_defines,time_macros "${CCACHE_PROGRAM}")
  set(CMAKE_C_COMPILER_LAUNCHER "${CCACHE_PROGRAM}")
endif()

add_library(corvane_settings INTERFACE)
# Contraction would change the rounding of sample values from machine to machine.
target_compile_options(corvane_settings INTERFACE
  -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wnon-virtual-dtor
  -Woverloaded-virtual -Werror -ffp-contract=off)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  # GCC 12 takes its own inlined std::string code for overlapping copies (GCC bug 105651).
  target_compile_options(corvane_settings INTERFACE -Wno-restrict)
endif()
target_compile_definitions(corvane_settings INTERFACE
  QT_NO_CAST_TO_ASCII QT_NO_URL_CAST_FROM_STRING QT_NO_FOREACH
  QT_DISABLE_DEPRECATED_BEFORE=0x060400)
if(CORVANE_SANITIZE)
  target_compile_options(corvane_settings INTERFACE
    -fsanitize=${CORVANE_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  string(REPLACE "fuzzer-no-link," "" link_sanitize "${CORVANE_SANITIZE}")
  target_link_options(corvane_settings INTERFACE -fsanitize=${link_sanitize})
endif()

# A file in the build folder that is there only after a complete configuration, and tells whether it
# has tests. scripts/build reads it.
set(configuration_marker "${CMAKE_BINARY_DIR}/configured.txt")

function(corvane_begin_configuration)
  file(REMOVE "${configuration_marker}")
  set_property(GLOBAL PROPERTY corvane_notes "")
endfunction()

# corvane_note(TEXT): a line of the summary.
function(corvane_note text)
  set_property(GLOBAL APPEND PROPERTY corvane_notes "${text}")
endfunction()

# corvane_note_peer(NAME FOUND): says in the summary whether a benchmark's peer is there.
function(corvane_note_peer name found)
  if(found)
    corvane_note("Benchmark peer ${name}: found")
  else()
    corvane_note("Benchmark peer ${name}: missing, its benchmarks are left out")
  endif()
endfunction()

function(corvane_end_configuration)
  message(STATUS "Corvane ${PROJECT_VERSION} ${CMAKE_BUILD_TYPE}: tests ${CORVANE_TESTS}, "
    "benchmarks ${CORVANE_BENCH}, fuzz targets ${CORVANE_FUZZ}")
  get_property(notes GLOBAL PROPERTY corvane_notes)
  foreach(note IN LISTS notes)
    message(STATUS "${note}")
  endforeach()
  file(WRITE "${configuration_marker}" "tests=${CORVANE_TESTS}\n")
endfunction()

# Parsing the headers of Qt takes most of a compilation. Object libraries hold them ready: for
# what works without a window, for windows, and for the command line. A target that uses one compiles
# with the flags of that library.
option(CORVANE_PCH "Precompile the headers of Qt and of the standard library" ON)

function(corvane_precompile_headers)
  if(NOT CORVANE_PCH)
    return()
  endif()
  set(core <algorithm> <array> <atomic> <chrono> <cmath> <complex> <functional> <map> <memory>
    <optional> <span> <string> <string_view> <thread> <vector>
    <QByteArray> <QCoreApplication> <QDir> <QFile> <QFileInfo> <QJsonArray> <QJsonDocument>
    <QJsonObject> <QList> <QMutex> <QObject> <QRegularExpression> <QSettings> <QString>
    <QStringList> <QTextStream> <QThread> <QTimer> <QVariant>)
  set(window <QAction> <QApplication> <QBoxLayout> <QButtonGroup> <QCheckBox> <QComboBox> <QDialog>
    <QFileDialog> <QFormLayout> <QGridLayout> <QGroupBox> <QHeaderView> <QImage> <QKeyEvent> <QLabel>
    <QLineEdit> <QMenu> <QMessageBox> <QPainter> <QPlainTextEdit> <QPushButton> <QRadioButton>
    <QStackedWidget> <QTableWidget> <QToolButton> <QTreeWidget>)
  set(empty "${CMAKE_BINARY_DIR}/empty.cpp")
  file(WRITE "${empty}" "")
  foreach(kind IN ITEMS core window commands)
    add_library(corvane_headers_${kind} OBJECT EXCLUDE_FROM_ALL "${empty}")
    target_link_libraries(corvane_headers_${kind} PRIVATE Qt6::Core corvane_settings)
    target_precompile_headers(corvane_headers_${kind} PRIVATE ${core})
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
      target_compile_options(corvane_headers_${kind} PRIVATE -fpch-preprocess)
    endif()
  endforeach()
  target_link_libraries(corvane_headers_window PRIVATE Qt6::Widgets)
  target_precompile_headers(corvane_headers_window PRIVATE ${window})
  target_precompile_headers(corvane_headers_commands PRIVATE <CLI/CLI.hpp>)
endfunction()

# corvane_use_headers(NAME core|window|commands): compiles a target with precompiled headers, if they are on.
function(corvane_use_headers name kind)
  if(TARGET corvane_headers_${kind})
    target_precompile_headers(${name} REUSE_FROM corvane_headers_${kind})
    if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
      target_compile_options(${name} PRIVATE -fpch-preprocess)
    endif()
  endif()
endfunction()

# corvane_add_folders(TABLE): adds the folders of a table, those that are there, in its order.
function(corvane_add_folders table)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS "${table}")
  file(STRINGS "${table}" lines REGEX "^[^#]")
  foreach(line IN LISTS lines)
    string(REGEX MATCH "^[^ ]+" folder "${line}")
    # corvane_add_library reads the kind.
    string(REGEX MATCH "[a-z]+$" corvane_folder_kind "${line}")
    if(EXISTS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/CMakeLists.txt")
      add_subdirectory(${folder})
    endif()
  endforeach()
endfunction()

# corvane_add_children(FOLDER): adds each child folder that has a CMakeLists.txt.
function(corvane_add_children folder)
  file(GLOB children CONFIGURE_DEPENDS "${CMAKE_CURRENT_SOURCE_DIR}/${folder}/*/CMakeLists.txt")
  foreach(child IN LISTS children)
    get_filename_component(child_folder "${child}" DIRECTORY)
    add_subdirectory("${child_folder}")
  endforeach()
endfunction()

# corvane_add_library(NAME SOURCES ... LINK ...): a static library of one folder. Its headers are
# included as "folder/Header.h", or by their bare name inside the folder.
function(corvane_add_library name)
  cmake_parse_arguments(arg "" "" "SOURCES;LINK" ${ARGN})
  add_library(${name} STATIC ${arg_SOURCES})
  set_target_properties(${name} PROPERTIES AUTOMOC ON AUTOUIC ON AUTORCC ON)
  target_include_directories(${name} PUBLIC "${CMAKE_SOURCE_DIR}/src")
  target_link_libraries(${name} PUBLIC ${arg_LINK} PRIVATE corvane_settings)
  corvane_use_headers(${name} ${corvane_folder_kind})
endfunction()

# corvane_add_program(NAME SOURCES ... LINK ...): an executable in the build's bin folder.
function(corvane_add_program name)
  cmake_parse_arguments(arg "" "" "SOURCES;LINK" ${ARGN})
  add_executable(${name} ${arg_SOURCES})
  set_target_properties(${name} PROPERTIES AUTOMOC ON AUTOUIC ON AUTORCC ON)
  target_include_directories(${name} PRIVATE "${CMAKE_SOURCE_DIR}/src")
  target_link_libraries(${name} PRIVATE ${arg_LINK} corvane_settings)
endfunction()

# corvane_add_test(NAME LABEL unit|gui|instrument|e2e [THREADED] SOURCES ... LINK ...
# [ENVIRONMENT ...]): a Qt Test program with tests/support, run without a display and with settings
# and temporary files of its own. What drives modal windows comes with the label gui; others link
# corvane_test_windows. THREADED: several threads work in it or in the programs that it starts, so
# that it is run under the thread sanitizer as well.
function(corvane_add_test name)
  cmake_parse_arguments(arg "THREADED" "LABEL" "SOURCES;LINK;ENVIRONMENT" ${ARGN})
  set(support corvane_test_support)
  set(headers core)
  if(arg_LABEL STREQUAL "gui")
    list(PREPEND support corvane_test_windows)
    set(headers window)
  endif()
  corvane_add_program(${name} SOURCES ${arg_SOURCES} LINK ${arg_LINK} ${support} Qt6::Test)
  corvane_use_headers(${name} ${headers})
  target_include_directories(${name} PRIVATE "${CMAKE_SOURCE_DIR}/tests")
  set_target_properties(${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/tests")
  add_test(NAME ${name} COMMAND ${name})
  if(CORVANE_SANITIZE STREQUAL "thread")
    target_link_libraries(${name} PRIVATE $<TARGET_OBJECTS:corvane_tsan_qt>)
  elseif(CORVANE_SANITIZE MATCHES "address")
    target_link_libraries(${name} PRIVATE $<TARGET_OBJECTS:corvane_asan_qt>)
  endif()
  if(arg_THREADED)
    list(APPEND arg_LABEL threads)
    add_dependencies(threaded_tests ${name})
  endif()
  set_tests_properties(${name} PROPERTIES
    LABELS "${arg_LABEL}"
    ENVIRONMENT "QT_QPA_PLATFORM=offscreen;CORVANE_BIN=${CMAKE_BINARY_DIR}/bin;LC_ALL=C.UTF-8;UBSAN_OPTIONS=print_stacktrace=1;TSAN_OPTIONS=suppressions=${CMAKE_SOURCE_DIR}/tests/tsan/suppressions.txt die_after_fork=0;${arg_ENVIRONMENT}")
endfunction()

# corvane_add_bench(NAME SOURCES ... LINK ...): a Google Benchmark program; never part of ctest.
function(corvane_add_bench name)
  cmake_parse_arguments(arg "" "" "SOURCES;LINK" ${ARGN})
  corvane_add_program(${name} SOURCES ${arg_SOURCES} LINK ${arg_LINK} benchmark::benchmark)
  target_include_directories(${name} PRIVATE "${CMAKE_SOURCE_DIR}/bench")
  set_target_properties(${name} PROPERTIES
    AUTOMOC OFF AUTOUIC OFF AUTORCC OFF RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bench")
endfunction()

# corvane_add_fuzzer(NAME SOURCES ... LINK ...): a libFuzzer target; its seeds stand in the folder
# "corpus/NAME" beside its CMakeLists.txt.
function(corvane_add_fuzzer name)
  cmake_parse_arguments(arg "" "" "SOURCES;LINK" ${ARGN})
  corvane_add_program(${name} SOURCES ${arg_SOURCES} LINK ${arg_LINK})
  target_include_directories(${name} PRIVATE "${CMAKE_SOURCE_DIR}/fuzz")
  target_link_options(${name} PRIVATE -fsanitize=fuzzer)
  set_target_properties(${name} PROPERTIES
    AUTOMOC OFF AUTOUIC OFF AUTORCC OFF RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/fuzz")
  add_dependencies(fuzzers ${name})
endfunction()
