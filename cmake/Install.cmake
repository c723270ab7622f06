# Installation, and the desktop files that harbor carries for RegServer.
#
# `cmake --install <build> [--prefix DIR]` puts the program and everything it looks for
# beside itself into <prefix>/<libdir>/harbor/ — harbor, Tessel.dll, harbor.ini (naming
# that folder), help/shooter.hlp, include/, firmware/, samples/ and scenarios/ — and links
# <prefix>/bin/harbor to it. The program finds its settings, library and help file through
# its own resolved path, so the link can stand anywhere on PATH.
include_guard(GLOBAL)
include(GNUInstallDirs)
include(${CMAKE_CURRENT_LIST_DIR}/ResourceSettings.cmake)

set(HARBOR_INSTALL_DIR ${CMAKE_INSTALL_LIBDIR}/harbor CACHE STRING
    "Folder below the prefix that holds harbor and the files beside it")

# --- desktop files, embedded so that RegServer needs nothing beside the program ----------
set(harbor_desktop_dir ${CMAKE_SOURCE_DIR}/resources/desktop)
file(READ ${harbor_desktop_dir}/harbor.desktop.in HARBOR_DESKTOP_ENTRY)
file(READ ${harbor_desktop_dir}/harbor-onyx2.xml HARBOR_MIME_PACKAGE)
set_property(DIRECTORY ${CMAKE_SOURCE_DIR} APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS
             ${harbor_desktop_dir}/harbor.desktop.in ${harbor_desktop_dir}/harbor-onyx2.xml)
configure_file(${CMAKE_SOURCE_DIR}/cmake/DesktopFiles.h.in
               ${CMAKE_BINARY_DIR}/generated/app/DesktopFiles.h @ONLY)

function(harbor_install_rules)
  if(NOT TARGET harbor OR NOT TARGET tessel_sim)
    message(WARNING "harbor or tessel_sim is missing: no install rules")
    return()
  endif()
  # Called deferred in the top folder, where the variables set above are not seen.
  target_include_directories(harbor PRIVATE ${CMAKE_BINARY_DIR}/generated)

  set(dir ${HARBOR_INSTALL_DIR})
  set(res ${CMAKE_SOURCE_DIR}/resources)
  install(TARGETS harbor RUNTIME DESTINATION ${dir})
  install(TARGETS tessel_sim LIBRARY DESTINATION ${dir})
  install(FILES ${res}/help/shooter.hlp DESTINATION ${dir}/help)
  foreach(sub include firmware samples scenarios)
    install(DIRECTORY ${res}/${sub}/ DESTINATION ${dir}/${sub})
  endforeach()

  # harbor.ini as the build makes it, but naming the installed folder. The prefix is only
  # known when installing (--prefix), so the file is written then.
  harbor_resource_settings(${res} header_keys firmware_file)
  install(CODE "
    set(HARBOR_OUTPUT_DIR \"\${CMAKE_INSTALL_PREFIX}/${dir}\")
    if(IS_ABSOLUTE \"${dir}\")
      set(HARBOR_OUTPUT_DIR \"${dir}\")
    endif()
    set(HARBOR_HEADER_KEYS \"${header_keys}\")
    set(HARBOR_FIRMWARE_FILE \"${firmware_file}\")
    set(ini \"\$ENV{DESTDIR}\${HARBOR_OUTPUT_DIR}/harbor.ini\")
    message(STATUS \"Installing: \${ini}\")
    configure_file(\"${res}/harbor.ini.in\" \"\${ini}\" @ONLY)
  ")

  # <prefix>/bin/harbor -> the program in its folder.
  if(NOT IS_ABSOLUTE ${dir})
    file(RELATIVE_PATH target /prefix/${CMAKE_INSTALL_BINDIR} /prefix/${dir}/harbor)
    install(CODE "
      set(link \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${CMAKE_INSTALL_BINDIR}/harbor\")
      file(MAKE_DIRECTORY \"\$ENV{DESTDIR}\${CMAKE_INSTALL_PREFIX}/${CMAKE_INSTALL_BINDIR}\")
      file(REMOVE \"\${link}\")
      message(STATUS \"Installing: \${link} -> ${target}\")
      file(CREATE_LINK \"${target}\" \"\${link}\" SYMBOLIC)
    ")
  endif()
endfunction()

if(TARGET harbor AND TARGET tessel_sim)
  harbor_install_rules()
else()
  # Included before the program's and the library's folders: the rules wait for them.
  cmake_language(DEFER DIRECTORY ${CMAKE_SOURCE_DIR} CALL harbor_install_rules)
endif()
