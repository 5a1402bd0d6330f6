# widl generates the C++ header of every IDL file on every platform, and the
# type library for the Windows build.
find_program(TAV_WIDL NAMES x86_64-w64-mingw32-widl i686-w64-mingw32-widl widl REQUIRED)
set(TAV_WIDL_INCLUDE /usr/include/wine/wine/windows CACHE PATH "Folder holding oaidl.idl and friends")
set(TAV_WIDL_TLB_PATH /usr/lib/x86_64-linux-gnu/wine/x86_64-windows CACHE PATH "Folder holding stdole2.tlb")

# tav_widl(<idl> HEADER <out.h> [TLB <out.tlb>] [DEPENDS ...])
function(tav_widl idl)
  cmake_parse_arguments(W "" "HEADER;TLB" "DEPENDS" ${ARGN})
  set(outputs ${W_HEADER})
  set(args -h -H ${W_HEADER})
  if(W_TLB)
    list(APPEND outputs ${W_TLB})
    list(APPEND args -t -T ${W_TLB})
  endif()
  add_custom_command(
    OUTPUT ${outputs}
    COMMAND ${TAV_WIDL} -I${TAV_WIDL_INCLUDE} -I${CMAKE_CURRENT_SOURCE_DIR} -I${CMAKE_CURRENT_BINARY_DIR}
            -L${TAV_WIDL_TLB_PATH} ${args} ${idl}
    DEPENDS ${idl} ${W_DEPENDS}
    WORKING_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}
    COMMENT "widl ${idl}"
    VERBATIM)
endfunction()
