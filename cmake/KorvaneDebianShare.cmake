# Run by CPack over what is about to be packed, to have it as Debian wants it: manual pages
# compressed, without a name and a time in them, so that equal pages give equal packages; the
# completion for zsh in the folder where Debian's zsh looks for those of packages.
file(GLOB_RECURSE files "${CPACK_TEMPORARY_DIRECTORY}/*")
foreach(file IN LISTS files)
  if(file MATCHES "/man/man1/[^/]*\\.1$")
    execute_process(COMMAND gzip -9nf "${file}" COMMAND_ERROR_IS_FATAL ANY)
  elseif(file MATCHES "^(.*/zsh)/site-functions/([^/]*)$")
    file(MAKE_DIRECTORY "${CMAKE_MATCH_1}/vendor-completions")
    file(RENAME "${file}" "${CMAKE_MATCH_1}/vendor-completions/${CMAKE_MATCH_2}")
    file(REMOVE_RECURSE "${CMAKE_MATCH_1}/site-functions")
  endif()
endforeach()
