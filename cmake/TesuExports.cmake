# tesu_limit_exports(TARGET MAPFILE): on ELF platforms, a linker version script keeps the
# target's dynamic symbol table to the names MAPFILE lists. (Windows DLLs export what their
# export marks and module-definition files say.)
function(tesu_limit_exports target mapfile)
  if(WIN32 OR APPLE)
    return()
  endif()
  target_link_options(${target} PRIVATE "LINKER:--version-script=${mapfile}")
  set_property(TARGET ${target} APPEND PROPERTY LINK_DEPENDS ${mapfile})
endfunction()
