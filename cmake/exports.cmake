# The export table (api/qoraexports.def) is the one list of exported calls.
# On Linux the plain names of the calls marked as built are the only global
# symbols of the library; a Windows build generates its decorated names
# (name@bytes) from the same table.
function(qora_write_version_script table out)
  file(STRINGS ${table} lines REGEX "^QORA_CALL\\(")
  set(names "")
  foreach(line IN LISTS lines)
    if(line MATCHES "^QORA_CALL\\(([A-Za-z0-9_]+), *([0-9]+), *([A-Za-z0-9_]+), *BUILT\\)")
      string(APPEND names "    ${CMAKE_MATCH_3};\n")
    endif()
  endforeach()
  set(content "{\n")
  if(names)
    string(APPEND content "  global:\n${names}")
  endif()
  string(APPEND content "  local:\n    *;\n};\n")
  file(CONFIGURE OUTPUT ${out} CONTENT "${content}")
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${table})
endfunction()
