# Makes LINK a symbolic link to the sample installation SAMPLE (a copy where links cannot be
# made), so that a tool in the build tree finds the sample where an installed one does.
cmake_minimum_required(VERSION 3.20)
cmake_path(NORMAL_PATH LINK)
if(IS_SYMLINK "${LINK}" OR EXISTS "${LINK}")
  return()
endif()
get_filename_component(_parent "${LINK}" DIRECTORY)
file(MAKE_DIRECTORY "${_parent}")
file(CREATE_LINK "${SAMPLE}" "${LINK}" COPY_ON_ERROR SYMBOLIC)
