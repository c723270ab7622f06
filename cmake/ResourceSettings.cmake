# The keys of harbor.ini that follow from what the resources folder holds, for the settings
# the build writes beside harbor and for those an installation writes.
include_guard(GLOBAL)

# harbor_resource_settings(<resources> <header-keys-var> <firmware-var>)
# <header-keys-var>: one HEADERS key per include file, "Header<n>=<file>" lines (the key's
# name is not used, the value names the file). <firmware-var>: the first good firmware
# image, the initial text of the firmware file name field, or empty.
function(harbor_resource_settings resources header_keys_var firmware_var)
  file(GLOB headers RELATIVE ${resources}/include CONFIGURE_DEPENDS ${resources}/include/*)
  list(SORT headers)
  set(keys "")
  set(index 1)
  foreach(header IN LISTS headers)
    string(APPEND keys "Header${index}=${header}\n")
    math(EXPR index "${index} + 1")
  endforeach()

  file(GLOB images RELATIVE ${resources}/firmware CONFIGURE_DEPENDS ${resources}/firmware/*)
  list(FILTER images EXCLUDE REGEX "^README|corrupt")
  list(SORT images)
  set(first "")
  if(images)
    list(GET images 0 first)
  endif()

  set(${header_keys_var} "${keys}" PARENT_SCOPE)
  set(${firmware_var} "${first}" PARENT_SCOPE)
endfunction()
