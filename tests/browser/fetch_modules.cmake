# Fetches what the browser tests need of npm into the folder MODULES, by the program NPM, from the
# lists LISTS. Where that fails, the build goes on: the tests say that they cannot run, and the next
# build tries again.
file(REMOVE "${MODULES}/installed")
file(COPY ${LISTS} DESTINATION "${MODULES}")
execute_process(COMMAND ${NPM} ci --no-audit --no-fund --loglevel=error
                WORKING_DIRECTORY "${MODULES}" RESULT_VARIABLE result)
if(result EQUAL 0)
  file(TOUCH "${MODULES}/installed")
else()
  message(WARNING "npm could not fetch what the browser tests need (${result}): they will fail. "
                  "All else is built; the next build tries again.")
endif()
