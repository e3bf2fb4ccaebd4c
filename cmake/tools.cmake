# The programs of obautil.
#
# A tool is compiled in two parts, so that others can take its modules:
#   <tool>_main     <tool>.cpp: the application's globals and zx_main
#   <tool>_modules  every other source of its folder; absent if there is none
# and then linked in the order: tool, entry library, hvl, zxlib.

# The folders of obautil that hold sources.
function(zx_find_tools result)
  file(GLOB sources CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/obautil/*/*.cpp)
  set(tools)
  foreach(source IN LISTS sources)
    cmake_path(GET source PARENT_PATH folder)
    cmake_path(GET folder FILENAME tool)
    list(APPEND tools ${tool})
  endforeach()
  list(REMOVE_DUPLICATES tools)
  set(${result} ${tools} PARENT_SCOPE)
endfunction()

# An object library with the include paths and flags of `tool`.
function(zx_tool_objects name tool)
  add_library(${name} OBJECT ${ARGN})
  target_include_directories(${name} PUBLIC ${CMAKE_SOURCE_DIR}/obautil/${tool})
  foreach(used IN LISTS ZX_TOOL_USES_${tool})
    target_include_directories(${name} PUBLIC
      ${CMAKE_SOURCE_DIR}/obautil/${used})
  endforeach()
  target_link_libraries(${name} PUBLIC hvl zxlib PRIVATE zx_library_flags)
endfunction()

function(zx_compile_tool tool)
  set(folder ${CMAKE_SOURCE_DIR}/obautil/${tool})
  file(GLOB modules CONFIGURE_DEPENDS ${folder}/*.cpp)
  list(REMOVE_ITEM modules ${folder}/${tool}.cpp)
  zx_tool_objects(${tool}_main ${tool} ${folder}/${tool}.cpp)
  if(modules)
    zx_tool_objects(${tool}_modules ${tool} ${modules})
  endif()
endfunction()

# Puts the modules of the named tools into `program`.
function(zx_take_modules program)
  foreach(tool IN LISTS ARGN)
    if(TARGET ${tool}_modules)
      target_link_libraries(${program} PRIVATE ${tool}_modules)
    endif()
  endforeach()
endfunction()

# REQUIRES: zx_compile_tool was called for every tool.
function(zx_link_tool tool)
  set(kind console)
  if(DEFINED ZX_TOOL_KIND_${tool})
    set(kind ${ZX_TOOL_KIND_${tool}})
  endif()
  add_executable(${tool})
  target_link_libraries(${tool} PRIVATE ${tool}_main)
  zx_take_modules(${tool} ${tool} ${ZX_TOOL_USES_${tool}})
  target_link_libraries(${tool} PRIVATE zxlib_${kind} hvl zxlib)
endfunction()
