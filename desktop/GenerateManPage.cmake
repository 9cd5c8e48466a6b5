# Writes a gzipped man page at build time. With PROGRAM, the page's description is the program's
# own usage text, so the page cannot drift from "--help"; with SOURCE, a page written in roff is
# taken as it is.
#   cmake -DPROGRAM=path/lumekvideotool -DNAME=lumekvideotool -DSUMMARY="..." -DVERSION=1.2.3
#         -DOUTPUT=lumekvideotool.1.gz -P GenerateManPage.cmake
#   cmake -DSOURCE=lumekvideoviewer.1.in -DVERSION=1.2.3 -DOUTPUT=lumekvideoviewer.1.gz -P GenerateManPage.cmake

if(PROGRAM)
  execute_process(COMMAND ${PROGRAM} --help OUTPUT_VARIABLE Usage RESULT_VARIABLE Result)
  if(NOT Result EQUAL 0)
    message(FATAL_ERROR "${PROGRAM} --help failed: ${Result}")
  endif()
  # Roff: backslashes and minus signs are escaped, and a line may not start with a control character.
  string(REPLACE "\\" "\\e" Usage "${Usage}")
  string(REPLACE "-" "\\-" Usage "${Usage}")
  string(REGEX REPLACE "(^|\n)([.'])" "\\1\\\\&\\2" Usage "${Usage}")
  string(TOUPPER "${NAME}" Title)
  string(REPLACE "-" "\\-" Summary "${SUMMARY}")
  set(Page ".TH ${Title} 1 \"\" \"LumekVideoViewer ${VERSION}\" \"User Commands\"
.SH NAME
${NAME} \\- ${Summary}
.SH SYNOPSIS
.B ${NAME}
.I COMMAND
.RI [ ARGUMENTS ]
.br
.B ${NAME}
.B \\-\\-help
.SH DESCRIPTION
.nf
${Usage}.fi
.SH SEE ALSO
.BR lumekvideoviewer (1)
")
else()
  file(READ "${SOURCE}" Page)
  string(REPLACE "%VERSION%" "${VERSION}" Page "${Page}")
endif()

get_filename_component(Folder "${OUTPUT}" DIRECTORY)
get_filename_component(Name "${OUTPUT}" NAME_WLE)
file(WRITE "${Folder}/${Name}" "${Page}")
# -n: no name or time stamp in the archive, so the package builds the same twice.
execute_process(COMMAND gzip -9nf "${Folder}/${Name}" RESULT_VARIABLE Result)
if(NOT Result EQUAL 0)
  message(FATAL_ERROR "gzip failed for ${Folder}/${Name}")
endif()
