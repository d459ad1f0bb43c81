# Reads fenced blocks out of a page. As a script, it runs the page's program and compares its output with the page:
# cmake -DPAGE=... -DPROGRAM=... -DEMULATOR=... -DDATA_DIR=... -P page.cmake

# Returns the first block of PAGE whose opening fence is ```LANGUAGE, or an empty text.
function(read_block result page language)
    file(READ "${page}" text)
    string(FIND "${text}" "\n```${language}\n" begin)
    if(begin EQUAL -1)
        set(${result} "" PARENT_SCOPE)
        return()
    endif()
    string(LENGTH "\n```${language}\n" fence)
    math(EXPR begin "${begin} + ${fence}")
    string(SUBSTRING "${text}" ${begin} -1 text)
    string(FIND "${text}" "```" end)
    string(SUBSTRING "${text}" 0 ${end} text)
    set(${result} "${text}" PARENT_SCOPE)
endfunction()

if(NOT CMAKE_SCRIPT_MODE_FILE STREQUAL CMAKE_CURRENT_LIST_FILE)
    return()
endif()

# The data directory contains the files that the page shows, and nothing from an earlier run.
file(REMOVE_RECURSE "${DATA_DIR}")
file(MAKE_DIRECTORY "${DATA_DIR}")
foreach(name IN ITEMS debug_ltn.ini Varnek_Config.cfg)
    read_block(content "${PAGE}" "ini ${name}")
    if(content)
        file(WRITE "${DATA_DIR}${name}" "${content}")
    endif()
endforeach()
execute_process(COMMAND ${EMULATOR} "${PROGRAM}"
    RESULT_VARIABLE status OUTPUT_VARIABLE printed ERROR_VARIABLE logged)
file(REMOVE_RECURSE "${DATA_DIR}")
file(MAKE_DIRECTORY "${DATA_DIR}")
if(NOT status EQUAL 0)
    message(FATAL_ERROR "${PROGRAM} ended with ${status}:\n${printed}${logged}")
endif()

read_block(expected "${PAGE}" text)
if(NOT printed STREQUAL expected)
    message(FATAL_ERROR "The page shows\n${expected}the program prints\n${printed}")
endif()
# Date, time, process and thread differ in each run, so they are removed from the log.
read_block(expected "${PAGE}" log)
foreach(text IN ITEMS expected logged)
    string(REGEX REPLACE "[0-9-]+ [0-9:.]+ +[0-9]+ +[0-9]+ ([VDIEF]) " "\\1 " ${text} "${${text}}")
endforeach()
if(expected AND NOT logged STREQUAL expected)
    message(FATAL_ERROR "The page shows\n${expected}the log has\n${logged}")
endif()
