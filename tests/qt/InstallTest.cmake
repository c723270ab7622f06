# Installs the build into a fresh prefix and runs the installed harbor there: it must find its
# settings, the simulated library, the include files and the help file in their installed
# places, from a working directory of its own.
#   cmake -DBUILD_DIR=<build> -DPREFIX=<dir> -P InstallTest.cmake
file(REMOVE_RECURSE ${PREFIX})
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${PREFIX}
  RESULT_VARIABLE status OUTPUT_QUIET ERROR_VARIABLE errors)
if(NOT status EQUAL 0)
  message(FATAL_ERROR "cmake --install failed: ${errors}")
endif()
set(folder ${PREFIX}/lib/harbor)
foreach(file bin/harbor lib/harbor/harbor lib/harbor/Tessel.dll lib/harbor/harbor.ini
             lib/harbor/help/shooter.hlp lib/harbor/include/Onyx2MLT.h)
  if(NOT EXISTS ${PREFIX}/${file})
    message(FATAL_ERROR "not installed: ${file}")
  endif()
endforeach()
file(READ ${folder}/harbor.ini ini)
if(NOT ini MATCHES "DLL=${folder}/")
  message(FATAL_ERROR "the installed harbor.ini does not name the installed folder:\n${ini}")
endif()

set(work ${PREFIX}/work)
file(MAKE_DIRECTORY ${work})
# A sample that includes a header, downloaded and run, through the link on PATH's folder.
file(WRITE ${work}/download.cmds "Test\nAuto Run on\nDownload\nExpect Title Tessel Test Client - music.onyx2\n")
execute_process(COMMAND ${CMAKE_COMMAND} -E env --unset=TESSEL_SIM
    ${PREFIX}/bin/harbor --headless --script ${work}/download.cmds ${folder}/samples/music.onyx2
  WORKING_DIRECTORY ${work} RESULT_VARIABLE status OUTPUT_VARIABLE output ERROR_VARIABLE errors)
if(NOT status EQUAL 0 OR NOT output MATCHES "Downloaded ok")
  message(FATAL_ERROR "the installed harbor failed (${status}):\n${output}${errors}")
endif()
# A brick that does not answer: the Trouble Shooter opens its topic from the installed help.
file(WRITE ${work}/shooter.cmds "Answer yes\nTest\nHelp 2000\n")
execute_process(COMMAND ${CMAKE_COMMAND} -E env TESSEL_SIM=${folder}/scenarios/brick-off.sim
    ${PREFIX}/bin/harbor --headless --script ${work}/shooter.cmds
  WORKING_DIRECTORY ${work} OUTPUT_VARIABLE output ERROR_VARIABLE errors)
if(NOT output MATCHES "\\[help\\] topic Onyx_not_alive")
  message(FATAL_ERROR "the installed help did not open:\n${output}${errors}")
endif()
file(REMOVE_RECURSE ${PREFIX})
