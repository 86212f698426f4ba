# Spell-checking dictionaries beside bin/, under the names the start-up looks for:
# Dictionaries/vdr_<SUFFIX>.DIC and .AFF, and an empty user dictionary per language.
# Taken from the hunspell dictionaries of the system (Debian: hunspell-de-de, hunspell-en-us, hunspell-es).
set(VD_HUNSPELL_DIR /usr/share/hunspell CACHE PATH "Folder of the system's hunspell dictionaries")
set(vd_dictionaries_dir ${CMAKE_BINARY_DIR}/Dictionaries)

# Suffix, then the system dictionaries to try in order.
set(vd_dictionaries_DE de_DE)
set(vd_dictionaries_EN en_GB en_US)
set(vd_dictionaries_USA en_US)
set(vd_dictionaries_ES es_ES es)

foreach(suffix DE EN USA ES)
  set(found "")
  foreach(name IN LISTS vd_dictionaries_${suffix})
    if(EXISTS ${VD_HUNSPELL_DIR}/${name}.dic AND EXISTS ${VD_HUNSPELL_DIR}/${name}.aff)
      set(found ${name})
      break()
    endif()
  endforeach()
  if(found)
    # configure_file follows the package's symbolic links and copies again when the source changes.
    configure_file(${VD_HUNSPELL_DIR}/${found}.dic ${vd_dictionaries_dir}/vdr_${suffix}.DIC COPYONLY)
    configure_file(${VD_HUNSPELL_DIR}/${found}.aff ${vd_dictionaries_dir}/vdr_${suffix}.AFF COPYONLY)
  else()
    message(STATUS "No hunspell dictionary for vdr_${suffix} (tried ${vd_dictionaries_${suffix}} in ${VD_HUNSPELL_DIR}); "
                   "spell checking in that language will report the missing file")
  endif()
  # The user's own words: created once, never overwritten.
  if(NOT EXISTS ${vd_dictionaries_dir}/vdr_userDict_${suffix}.txt)
    file(WRITE ${vd_dictionaries_dir}/vdr_userDict_${suffix}.txt "")
  endif()
endforeach()
