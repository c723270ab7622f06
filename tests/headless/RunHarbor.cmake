# Runs harbor from an empty working directory and checks its exit status, a text of its
# output, and that it wrote nothing into the working directory.
#   -DHARBOR=<path> -DWORKDIR=<dir> -DEXPECT_STATUS=<n> -DEXPECT_TEXT=<regex>
#   -DARGS=<;-list> [-DINPUT=<file>]
file(REMOVE_RECURSE ${WORKDIR})
file(MAKE_DIRECTORY ${WORKDIR})
set(input_args)
if(INPUT)
  set(input_args INPUT_FILE ${INPUT})
endif()
execute_process(COMMAND ${HARBOR} ${ARGS}
  WORKING_DIRECTORY ${WORKDIR}
  RESULT_VARIABLE status OUTPUT_VARIABLE output ERROR_VARIABLE errors ${input_args})
message("${output}${errors}")
if(NOT status EQUAL EXPECT_STATUS)
  message(FATAL_ERROR "harbor exited with ${status}, not ${EXPECT_STATUS}")
endif()
if(NOT "${output}${errors}" MATCHES "${EXPECT_TEXT}")
  message(FATAL_ERROR "harbor did not print ${EXPECT_TEXT}")
endif()
file(GLOB left ${WORKDIR}/*)
if(left)
  message(FATAL_ERROR "harbor wrote into the working directory: ${left}")
endif()
file(REMOVE_RECURSE ${WORKDIR})
