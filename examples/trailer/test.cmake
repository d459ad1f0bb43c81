# Runs the program to append CRCs to files of awkward sizes, check them, and detect a damaged file:
#   cmake -DPROGRAM=... -DEMULATOR=... -DFILE=... -P test.cmake

# run(STATUS ARGUMENT...)
function(run status)
    execute_process(COMMAND ${EMULATOR} ${PROGRAM} ${ARGN} RESULT_VARIABLE result OUTPUT_QUIET ERROR_QUIET)
    if(NOT result EQUAL status)
        message(FATAL_ERROR "trailer ${ARGN} ended with ${result}, not ${status}, on ${length} bytes")
    endif()
endfunction()

file(WRITE "${FILE}" "123456789")
run(0 "${FILE}")
file(READ "${FILE}" content HEX)
if(NOT content STREQUAL "3132333435363738390376e6e7")
    message(FATAL_ERROR "The check value is wrong: ${content}")
endif()
# Sizes around one piece and two pieces, with and without the trailer.
foreach(length IN ITEMS 4 65532 65535 65536 65537 65540 131071 131073 200000)
    string(REPEAT "a" ${length} content)
    file(WRITE "${FILE}" "${content}")
    run(0 "${FILE}")
    run(0 --check "${FILE}")
    file(APPEND "${FILE}" "b")
    run(1 --check "${FILE}")
endforeach()
file(WRITE "${FILE}" "abc")
run(1 "${FILE}")
