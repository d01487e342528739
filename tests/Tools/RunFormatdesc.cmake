# Runs formatdesc once and checks what a user would see:
#   cmake -DTOOL=<formatdesc> [-DSTATUS=<n>] [-DEXPECTED=<file>] [-DCONTAINS=<text>]
#         [-DMESSAGE=<text> | -DMESSAGE_MATCH=<regex>] -P RunFormatdesc.cmake -- <arguments>...
# - the exit status is STATUS (0 when not given); a crash shows as a status that is not a number;
# - with EXPECTED, standard output equals the file; with CONTAINS, it contains the text;
# - with MESSAGE, standard error is the one line "formatdesc: MESSAGE" and standard output is
#   empty; with MESSAGE_MATCH, that line matches the regex instead; otherwise standard error is
#   empty.
# With the environment variable FORMATDESC_UPDATE_EXPECTED set, EXPECTED is rewritten with the
# output instead of compared, after the status is checked.
cmake_minimum_required(VERSION 3.21)

set(arguments)
set(after_separator FALSE)
math(EXPR last "${CMAKE_ARGC} - 1")
foreach(i RANGE ${last})
  if(after_separator)
    list(APPEND arguments "${CMAKE_ARGV${i}}")
  elseif(CMAKE_ARGV${i} STREQUAL "--")
    set(after_separator TRUE)
  endif()
endforeach()
if(NOT DEFINED STATUS)
  set(STATUS 0)
endif()

execute_process(COMMAND "${TOOL}" ${arguments} RESULT_VARIABLE status OUTPUT_VARIABLE out
                ERROR_VARIABLE err)
string(REPLACE ";" " " shown "${arguments}")
if(NOT status STREQUAL STATUS)
  message(FATAL_ERROR "formatdesc ${shown}: exit status ${status}, expected ${STATUS}\n"
                      "stderr: ${err}")
endif()

if(DEFINED EXPECTED AND DEFINED ENV{FORMATDESC_UPDATE_EXPECTED})
  file(WRITE "${EXPECTED}" "${out}")
  message(STATUS "Rewrote ${EXPECTED}")
elseif(DEFINED EXPECTED)
  file(READ "${EXPECTED}" expected)
  if(NOT out STREQUAL expected)
    message(FATAL_ERROR "formatdesc ${shown}: output differs from ${EXPECTED}:\n${out}")
  endif()
endif()
if(DEFINED CONTAINS)
  string(FIND "${out}" "${CONTAINS}" at)
  if(at EQUAL -1)
    message(FATAL_ERROR "formatdesc ${shown}: output lacks '${CONTAINS}':\n${out}")
  endif()
endif()

if(DEFINED MESSAGE OR DEFINED MESSAGE_MATCH)
  if(NOT out STREQUAL "")
    message(FATAL_ERROR "formatdesc ${shown}: printed to standard output on error:\n${out}")
  endif()
  if(NOT err MATCHES "^formatdesc: [^\n]*\n$")
    message(FATAL_ERROR "formatdesc ${shown}: not one 'formatdesc: ' line on stderr:\n${err}")
  endif()
  if(DEFINED MESSAGE AND NOT err STREQUAL "formatdesc: ${MESSAGE}\n")
    message(FATAL_ERROR "formatdesc ${shown}: stderr is\n${err}expected\nformatdesc: ${MESSAGE}")
  endif()
  if(DEFINED MESSAGE_MATCH AND NOT err MATCHES "${MESSAGE_MATCH}")
    message(FATAL_ERROR "formatdesc ${shown}: stderr does not match ${MESSAGE_MATCH}:\n${err}")
  endif()
elseif(NOT err STREQUAL "")
  message(FATAL_ERROR "formatdesc ${shown}: unexpected stderr:\n${err}")
endif()
