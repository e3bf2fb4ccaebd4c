# Each public header compiles alone; on Windows also behind the system's own
# header, whose macros must not meet our names.

file(GLOB headers CONFIGURE_DEPENDS
     ${CMAKE_SOURCE_DIR}/zxlib/*.h ${CMAKE_SOURCE_DIR}/hvl/*.h)
set(header_units)
foreach(header IN LISTS headers)
  cmake_path(GET header STEM stem)
  set(unit ${CMAKE_BINARY_DIR}/headers/${stem}.cpp)
  set(text "#include \"${header}\"\n")
  if(WIN32)
    set(behind ${CMAKE_BINARY_DIR}/headers/${stem}_behind.cpp)
    file(CONFIGURE OUTPUT ${behind} CONTENT "#include <windows.h>\n${text}")
    # A parameter may be called as one of the system's types.
    set_source_files_properties(${behind} PROPERTIES COMPILE_OPTIONS -Wno-shadow)
    list(APPEND header_units ${behind})
  endif()
  file(CONFIGURE OUTPUT ${unit} CONTENT "${text}")
  list(APPEND header_units ${unit})
endforeach()
list(FILTER header_units EXCLUDE REGEX "zxplat_(posix|win32)_impl")

add_library(zx_headers OBJECT ${header_units})
target_link_libraries(zx_headers PRIVATE hvl zxlib zx_library_flags)
