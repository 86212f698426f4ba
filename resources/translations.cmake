# Qt's own translations beside bin/, so that standard buttons and dialogs speak the interface's
# language: Translations/qt_<lang>.qm and the catalogues it refers to (Debian: qttranslations5-l10n).
# Where they are missing here, the program takes them from the system's Qt at start-up.
set(VD_QT_TRANSLATIONS_DIR "" CACHE PATH "Folder of Qt's own translations (empty: ask qmake)")
if(NOT VD_QT_TRANSLATIONS_DIR)
  get_target_property(vd_qmake Qt5::qmake IMPORTED_LOCATION)
  execute_process(COMMAND ${vd_qmake} -query QT_INSTALL_TRANSLATIONS
                  OUTPUT_VARIABLE VD_QT_TRANSLATIONS_DIR OUTPUT_STRIP_TRAILING_WHITESPACE)
endif()
set(vd_translations_dir ${CMAKE_BINARY_DIR}/Translations)

foreach(lang de en es)
  if(NOT EXISTS ${VD_QT_TRANSLATIONS_DIR}/qt_${lang}.qm)
    message(STATUS "No Qt translation qt_${lang}.qm in '${VD_QT_TRANSLATIONS_DIR}' "
                   "(install qttranslations5-l10n); Qt's buttons and dialogs stay English in that language")
    continue()
  endif()
  # qt_<lang>.qm only names the catalogues of the modules; they must lie beside it.
  foreach(catalogue qt qtbase qtscript qtmultimedia qtxmlpatterns)
    if(EXISTS ${VD_QT_TRANSLATIONS_DIR}/${catalogue}_${lang}.qm)
      configure_file(${VD_QT_TRANSLATIONS_DIR}/${catalogue}_${lang}.qm
                     ${vd_translations_dir}/${catalogue}_${lang}.qm COPYONLY)
    endif()
  endforeach()
endforeach()
