# Resources that are built into the program: one translation table a language, and the icons.

# qelvar_translations(TARGET): Resources/translations/<language>/*.tsv become <language>.qm under ":/translations".
function(qelvar_translations target)
  add_executable(qelvar-translation-tables ${CMAKE_SOURCE_DIR}/Platform/Tools/TranslationTables.cpp)
  set_target_properties(qelvar-translation-tables PROPERTIES AUTOMOC OFF)
  set(folder ${CMAKE_BINARY_DIR}/translations)
  file(MAKE_DIRECTORY ${folder})
  file(GLOB languages CONFIGURE_DEPENDS LIST_DIRECTORIES true RELATIVE ${CMAKE_SOURCE_DIR}/Resources/translations
    ${CMAKE_SOURCE_DIR}/Resources/translations/*)
  set(qrc "<RCC><qresource prefix=\"/translations\">\n")
  set(tables)
  foreach(language IN LISTS languages)
    file(GLOB fragments CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/Resources/translations/${language}/*.tsv)
    if(NOT fragments)
      continue()
    endif()
    add_custom_command(OUTPUT ${folder}/${language}.qm
      COMMAND qelvar-translation-tables ${language} ${folder}/qelvar_${language}.ts ${fragments}
      COMMAND Qt6::lrelease -silent -idbased ${folder}/qelvar_${language}.ts -qm ${folder}/${language}.qm
      DEPENDS qelvar-translation-tables ${fragments} VERBATIM
      COMMENT "Translation table of ${language}")
    string(APPEND qrc "<file alias=\"${language}.qm\">${folder}/${language}.qm</file>\n")
    list(APPEND tables ${folder}/${language}.qm)
  endforeach()
  qelvar_resource(${target} qelvar_translations "${qrc}</qresource></RCC>\n" "${tables}")
endfunction()

# qelvar_icons(TARGET): Resources/icons/*.svg under ":/icons".
function(qelvar_icons target)
  file(GLOB icons CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/Resources/icons/*.svg)
  set(qrc "<RCC><qresource prefix=\"/icons\">\n")
  foreach(icon IN LISTS icons)
    get_filename_component(name ${icon} NAME)
    string(APPEND qrc "<file alias=\"${name}\">${icon}</file>\n")
  endforeach()
  qelvar_resource(${target} qelvar_icons "${qrc}</qresource></RCC>\n" "${icons}")
endfunction()

# The resource file's text becomes a source of the target; Q_INIT_RESOURCE(name) in that target pulls it out of the archive.
function(qelvar_resource target name qrc files)
  set(file ${CMAKE_BINARY_DIR}/${name}.qrc)
  file(CONFIGURE OUTPUT ${file} CONTENT "${qrc}" @ONLY)
  set(source ${CMAKE_BINARY_DIR}/qrc_${name}.cpp)
  add_custom_command(OUTPUT ${source} COMMAND Qt6::rcc --name ${name} -o ${source} ${file}
    DEPENDS ${file} ${files} VERBATIM COMMENT "Resource ${name}")
  set_source_files_properties(${source} PROPERTIES SKIP_AUTOMOC ON SKIP_AUTOGEN ON)
  target_sources(${target} PRIVATE ${source})
endfunction()
