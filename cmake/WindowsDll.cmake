# Cross-compiles freestanding C++ into Windows DLLs with clang, lld-link and llvm-dlltool.
#
#   add_windows_import_lib(<name> <def file>)
#       Makes <name>.lib from a .def file (LIBRARY line + EXPORTS list) at build time.
#
#   add_windows_dll(<name> SOURCES <files...> [IMPORTS <import lib names...>]
#                   [OUTPUT_DIR <dir>] [ARCH x64|x86] [DEFINES <defs...>] [NO_ENTRY])
#       Builds <OUTPUT_DIR>/<name>.dll (default: the bin folder) with entry point DllMain.
#       A target <name>_dll builds it; the aggregate target windows_dlls builds every DLL.

find_program(WINDOWS_CXX NAMES clang++ clang++-14 REQUIRED)
find_program(WINDOWS_LINK NAMES lld-link lld-link-14 REQUIRED)
find_program(WINDOWS_DLLTOOL NAMES llvm-dlltool llvm-dlltool-14 REQUIRED)
find_program(WINDOWS_READOBJ NAMES llvm-readobj llvm-readobj-14 REQUIRED)

set(WINDOWS_LIB_DIR ${CMAKE_BINARY_DIR}/winlib)
file(MAKE_DIRECTORY ${WINDOWS_LIB_DIR})

# Freestanding: no C runtime, no exceptions or RTTI, no stack probes or cookies, and only the
# operator new/delete manglings that the known-import table carries.
set(WINDOWS_CXX_FLAGS
  -std=c++17 -O2 -ffreestanding -fno-exceptions -fno-rtti -fno-threadsafe-statics
  -fno-stack-protector -mno-stack-arg-probe -fno-aligned-allocation -fno-sized-deallocation
  -fno-builtin -Wall -Wextra -Werror
  -I${CMAKE_SOURCE_DIR}/Libraries/Common)

add_custom_target(windows_dlls ALL)

function(add_windows_import_lib name def)
  foreach(arch x64 x86)
    set(machine i386:x86-64)
    set(suffix "")
    if(arch STREQUAL "x86")
      set(machine i386)
      set(suffix "_x86")
    endif()
    set(lib ${WINDOWS_LIB_DIR}/${name}${suffix}.lib)
    add_custom_command(OUTPUT ${lib}
      COMMAND ${WINDOWS_DLLTOOL} -m ${machine} -d ${def} -l ${lib}
      DEPENDS ${def}
      COMMENT "Import library ${name}${suffix}.lib"
      VERBATIM)
    add_custom_target(${name}${suffix}_implib DEPENDS ${lib})
  endforeach()
endfunction()

function(add_windows_dll name)
  cmake_parse_arguments(W "NO_ENTRY" "OUTPUT_DIR;ARCH" "SOURCES;IMPORTS;DEFINES" ${ARGN})
  if(NOT W_OUTPUT_DIR)
    set(W_OUTPUT_DIR ${CHARTBAKE_BIN_DIR})
  endif()
  if(NOT W_ARCH)
    set(W_ARCH x64)
  endif()
  set(target x86_64-pc-windows-msvc)
  set(machine x64)
  set(libsuffix "")
  if(W_ARCH STREQUAL "x86")
    set(target i686-pc-windows-msvc)
    set(machine x86)
    set(libsuffix "_x86")
  endif()

  set(objdir ${CMAKE_CURRENT_BINARY_DIR}/${name}.objs)
  file(MAKE_DIRECTORY ${objdir})
  set(defines)
  foreach(d ${W_DEFINES})
    list(APPEND defines -D${d})
  endforeach()

  set(objs)
  foreach(src ${W_SOURCES})
    get_filename_component(abs ${src} ABSOLUTE)
    get_filename_component(base ${src} NAME_WE)
    set(obj ${objdir}/${base}.obj)
    add_custom_command(OUTPUT ${obj}
      COMMAND ${WINDOWS_CXX} --target=${target} ${WINDOWS_CXX_FLAGS} ${defines}
              -MD -MF ${obj}.d -c ${abs} -o ${obj}
      DEPENDS ${abs}
      DEPFILE ${obj}.d
      COMMENT "Windows ${W_ARCH} compile ${name}/${base}.cpp"
      VERBATIM)
    list(APPEND objs ${obj})
  endforeach()

  set(libs)
  set(libtargets)
  foreach(imp ${W_IMPORTS})
    list(APPEND libs ${WINDOWS_LIB_DIR}/${imp}${libsuffix}.lib)
    list(APPEND libtargets ${imp}${libsuffix}_implib)
  endforeach()

  set(entry /entry:DllMain)
  if(W_NO_ENTRY)
    set(entry /noentry)
  endif()
  file(MAKE_DIRECTORY ${W_OUTPUT_DIR})
  set(dll ${W_OUTPUT_DIR}/${name}.dll)
  add_custom_command(OUTPUT ${dll}
    COMMAND ${WINDOWS_LINK} /nologo /dll /nodefaultlib ${entry} /machine:${machine} /Brepro
            /implib:${objdir}/${name}.lib /out:${dll} ${objs} ${libs}
    DEPENDS ${objs} ${libs}
    COMMENT "Windows ${W_ARCH} link ${name}.dll"
    VERBATIM)
  add_custom_target(${name}_dll DEPENDS ${dll})
  if(libtargets)
    add_dependencies(${name}_dll ${libtargets})
  endif()
  add_dependencies(windows_dlls ${name}_dll)
  set_property(GLOBAL APPEND PROPERTY CHARTBAKE_WINDOWS_DLLS ${dll})
endfunction()
