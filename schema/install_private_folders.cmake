# Runs at install time: makes the folders of the database. Only the system account and its group
# may enter them, and the system account must be able to make files there.
set(private "$ENV{DESTDIR}${VELK_ROOT}/etc/private")
execute_process(COMMAND id -u OUTPUT_VARIABLE installer OUTPUT_STRIP_TRAILING_WHITESPACE
                COMMAND_ERROR_IS_FATAL ANY)

foreach(folder "${private}" "${private}/session")
  message(STATUS "Folder: ${folder}")
  file(MAKE_DIRECTORY "${folder}")
  file(CHMOD "${folder}" PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE)
  # Someone who is not root can stage the files; the packaging then sets the owner.
  if(installer EQUAL 0)
    execute_process(COMMAND chown "${VELK_SYSTEM_OWNER}" "${folder}" COMMAND_ERROR_IS_FATAL ANY)
  endif()
endforeach()
