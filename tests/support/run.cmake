# SPDX-License-Identifier: Apache-2.0

# run(COMMAND...): runs a command of a test script; a failure ends the script with all that was printed.
function(run)
    execute_process(COMMAND ${ARGV} RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE out)
    if(result)
        message(FATAL_ERROR "${ARGV}\n${out}")
    endif()
endfunction()
