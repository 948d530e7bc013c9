# The two libraries made from the same objects: a shared library that exports
# only the sixteen functions of tplex/lexer.h, and a static archive with
# everything (the table output operations included).
add_library(tplex SHARED $<TARGET_OBJECTS:tplex_objects>)
add_library(tplex_static STATIC $<TARGET_OBJECTS:tplex_objects>)
add_library(tplex::tplex ALIAS tplex)
add_library(tplex::tplex_static ALIAS tplex_static)

foreach(lib tplex tplex_static)
  target_include_directories(${lib} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/include>
    $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>)
  if(TPLEX_SANITIZE)
    target_link_options(${lib} PUBLIC -fsanitize=address,undefined)
  endif()
endforeach()
target_compile_definitions(tplex_static INTERFACE TPLEX_STATIC)

set_target_properties(tplex PROPERTIES
  VERSION ${PROJECT_VERSION}
  SOVERSION ${PROJECT_VERSION_MAJOR}
  C_VISIBILITY_PRESET hidden
  CXX_VISIBILITY_PRESET hidden)
set_target_properties(tplex_static PROPERTIES OUTPUT_NAME tplex)

if(WIN32)
  # The DLL needs nothing but Windows' own DLLs.
  target_link_options(tplex PRIVATE -static-libgcc -static-libstdc++ -static)
  # Only the sixteen functions marked dllexport by tplex/lexer.h: without a
  # marked symbol the linker would export every global symbol.
  target_link_options(tplex PRIVATE "LINKER:--exclude-all-symbols")
  set_target_properties(tplex PROPERTIES PREFIX "" IMPORT_PREFIX "lib")
  # On Windows the static archive and the DLL's import library would both be
  # libtplex.a; the archive keeps that name only where there is no DLL.
  set_target_properties(tplex_static PROPERTIES OUTPUT_NAME tplex_static)
elseif(CMAKE_SYSTEM_NAME STREQUAL "Linux")
  # Belt and braces behind hidden visibility: the version script names the
  # exports, so nothing else can leak into the dynamic symbol table.
  target_link_options(tplex PRIVATE
    "LINKER:--version-script=${PROJECT_SOURCE_DIR}/api/exports.map"
    "LINKER:--no-undefined")
  set_property(TARGET tplex APPEND PROPERTY LINK_DEPENDS
    ${PROJECT_SOURCE_DIR}/api/exports.map)
endif()
