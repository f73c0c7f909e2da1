# How every target of the project is made: one function for a module, one for a program, one for a test.

find_program( HarrowCcache ccache )
if( HarrowCcache )
  set( CMAKE_CXX_COMPILER_LAUNCHER ${CMAKE_COMMAND} -E env
       CCACHE_SLOPPINESS=pch_defines,time_macros,include_file_mtime,include_file_ctime
       ${HarrowCcache} )
endif()

add_library( HarrowFlags INTERFACE )
target_compile_features( HarrowFlags INTERFACE cxx_std_20 )
target_compile_options( HarrowFlags INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wnon-virtual-dtor -Woverloaded-virtual -Werror
  # GCC 12 sees overlaps and endless copies in inlined std::string operations where there are none.
  $<$<CXX_COMPILER_ID:GNU>:-Wno-stringop-overflow> $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>
  $<$<CXX_COMPILER_ID:GNU>:-fpch-preprocess> )
if( HARROW_SANITIZE )
  # Instrumented code hides from GCC what it knows elsewhere, so that these two warn of nothing.
  target_compile_options( HarrowFlags INTERFACE
    $<$<CXX_COMPILER_ID:GNU>:-Wno-array-bounds> $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized> )
endif()
if( HARROW_SANITIZE STREQUAL "address" )
  target_compile_options( HarrowFlags INTERFACE -fsanitize=address,undefined -fno-sanitize=vptr -fno-omit-frame-pointer )
  target_link_options( HarrowFlags INTERFACE -fsanitize=address,undefined -fno-sanitize=vptr )
elseif( HARROW_SANITIZE STREQUAL "thread" )
  # GCC says that a fence is not modelled; the only one is in the reference counts of the standard library.
  target_compile_options( HarrowFlags INTERFACE -fsanitize=thread -fno-omit-frame-pointer $<$<CXX_COMPILER_ID:GNU>:-Wno-tsan> )
  target_link_options( HarrowFlags INTERFACE -fsanitize=thread )
endif()

set( CMAKE_CXX_STANDARD 20 )
set( CMAKE_CXX_STANDARD_REQUIRED ON )
set( CMAKE_CXX_EXTENSIONS OFF )
set( CMAKE_POSITION_INDEPENDENT_CODE ON )
set( CMAKE_CXX_VISIBILITY_PRESET hidden )
set( CMAKE_VISIBILITY_INLINES_HIDDEN ON )
set( CMAKE_LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/lib )
set( CMAKE_RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/bin )
# The installed tree is bin/, lib/ and lib/harrow/; each finds libZEK beside or above itself.
set( CMAKE_INSTALL_RPATH "$ORIGIN:$ORIGIN/..:$ORIGIN/../lib" )

set( HarrowPchStd <algorithm> <array> <atomic> <cmath> <cstdint> <functional> <memory> <mutex> <string> <string_view> <unordered_map> <variant> <vector> )
set( HarrowPchQt ${HarrowPchStd} <QtCore/QObject> <QtCore/QPointer> <QtCore/QString> <QtCore/QTimer> <QtCore/QVariant>
  <QtCore/QVariantMap> <QtGui/QColor> <QtGui/QMatrix4x4> <QtGui/QOpenGLContext> <QtGui/QOpenGLExtraFunctions> <QtGui/QVector3D> )
set( HarrowPchQuick ${HarrowPchQt} <QtQml/QQmlEngine> <QtQml/QQmlPropertyMap> <QtQuick/QQuickItem> )

# For programs: under a sanitizer no library is unloaded, so that reports can name it.
function( harrow_keep_libraries Target )
  if( HARROW_SANITIZE )
    target_sources( ${Target} PRIVATE ${PROJECT_SOURCE_DIR}/tests/support/src/KeepLibraries.cpp )
    set_target_properties( ${Target} PROPERTIES ENABLE_EXPORTS ON )
  endif()
endfunction()

function( harrow_precompile Target Kind )
  if( Kind STREQUAL "QUICK" )
    target_precompile_headers( ${Target} PRIVATE ${HarrowPchQuick} )
  elseif( Kind STREQUAL "QT" )
    target_precompile_headers( ${Target} PRIVATE ${HarrowPchQt} )
  elseif( NOT Kind STREQUAL "NONE" )
    target_precompile_headers( ${Target} PRIVATE ${HarrowPchStd} )
  endif()
endfunction()

# harrow_module( Name
#   [SHARED|INTERFACE]                      static otherwise
#   HEADERS … SOURCES …                     headers matter to moc only
#   PUBLIC … PRIVATE …                      links; they are the floors
#   PCH QT|QUICK|NONE                       precompiled headers, standard library otherwise
#   TESTS … TEST_LINKS … TEST_MAIN <lib> )  one test program <Name>Tests
function( harrow_module Name )
  cmake_parse_arguments( M "SHARED;INTERFACE" "PCH;TEST_MAIN" "HEADERS;SOURCES;PUBLIC;PRIVATE;TESTS;TEST_LINKS" ${ARGN} )
  if( M_INTERFACE )
    add_library( ${Name} INTERFACE )
    target_include_directories( ${Name} INTERFACE ${CMAKE_CURRENT_SOURCE_DIR}/include )
    target_link_libraries( ${Name} INTERFACE HarrowFlags ${M_PUBLIC} )
  else()
    if( M_SHARED )
      add_library( ${Name} SHARED ${M_SOURCES} ${M_HEADERS} )
    else()
      add_library( ${Name} STATIC ${M_SOURCES} ${M_HEADERS} )
    endif()
    target_include_directories( ${Name} PUBLIC ${CMAKE_CURRENT_SOURCE_DIR}/include PRIVATE ${CMAKE_CURRENT_SOURCE_DIR}/src )
    target_link_libraries( ${Name} PUBLIC HarrowFlags ${M_PUBLIC} PRIVATE ${M_PRIVATE} )
    harrow_precompile( ${Name} "${M_PCH}" )
    if( M_PCH STREQUAL "QT" OR M_PCH STREQUAL "QUICK" )
      set_target_properties( ${Name} PROPERTIES AUTOMOC ON )
    endif()
  endif()
  add_library( Harrow::${Name} ALIAS ${Name} )
  if( M_TESTS AND HARROW_BUILD_TESTS )
    harrow_test( ${Name}Tests SOURCES ${M_TESTS} LINKS ${Name} ${M_TEST_LINKS} PCH "${M_PCH}" MAIN "${M_TEST_MAIN}" )
    target_include_directories( ${Name}Tests PRIVATE ${CMAKE_CURRENT_SOURCE_DIR}/src )
  endif()
endfunction()

# harrow_test( Name SOURCES … LINKS … [PCH QT|QUICK|NONE] [MAIN HarrowTestMain|HarrowTestGuiMain] )
# MAIN HarrowTestGuiMain gives the program a QApplication and needs a display.
function( harrow_test Name )
  cmake_parse_arguments( T "" "PCH;MAIN;TIMEOUT" "SOURCES;LINKS" ${ARGN} )
  if( NOT T_MAIN )
    set( T_MAIN HarrowTestMain )
  endif()
  if( NOT T_TIMEOUT )
    set( T_TIMEOUT 900 )
  endif()
  add_executable( ${Name} ${T_SOURCES} )
  target_link_libraries( ${Name} PRIVATE ${T_LINKS} HarrowFlags ${T_MAIN} )
  harrow_precompile( ${Name} "${T_PCH}" )
  harrow_keep_libraries( ${Name} )
  if( T_PCH STREQUAL "QT" OR T_PCH STREQUAL "QUICK" )
    set_target_properties( ${Name} PROPERTIES AUTOMOC ON )
  endif()
  add_test( NAME ${Name} COMMAND ${Name} --gtest_brief=1 )
  set_tests_properties( ${Name} PROPERTIES TIMEOUT ${T_TIMEOUT}
    ENVIRONMENT "HARROW_SOURCE_DIR=${CMAKE_SOURCE_DIR};HARROW_BINARY_DIR=${CMAKE_BINARY_DIR}" )
endfunction()
