# SPDX-License-Identifier: MIT
# Makes one C++ source of the HTML report's page, style and script:
#   cmake -D FOLDER=scanner/report/html -D OUTPUT=html_template.cpp -P embed_page.cmake
# "@name@" in page.html is replaced by the style, the script, and the hash of each as a Content-Security-Policy
# names it. "{{name}}" stays for the report.

# The bytes of a number in hexadecimal, as base64. Their count leaves a remainder of 2 when divided by 3, as the 32 bytes
# of a SHA-256 do.
function(base64_of_sha256 hexadecimal result)
  set(digits "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/")
  set(text "")
  # 60 hexadecimal digits are whole groups of 6, which make 4 digits each; 4 are left, and make 3.
  foreach(begin RANGE 0 60 6)
    string(SUBSTRING "${hexadecimal}00" ${begin} 6 group)
    math(EXPR number "0x${group}")
    foreach(shift IN ITEMS 18 12 6 0)
      math(EXPR digit "(${number} >> ${shift}) & 63")
      string(SUBSTRING "${digits}" ${digit} 1 digit)
      string(APPEND text "${digit}")
    endforeach()
  endforeach()
  string(SUBSTRING "${text}" 0 43 text)
  set(${result} "${text}=" PARENT_SCOPE)
endfunction()

file(READ ${FOLDER}/page.html page)
foreach(part IN ITEMS style.css script.js)
  get_filename_component(name ${part} NAME_WE)
  file(READ ${FOLDER}/${part} text)
  string(TOLOWER "${text}" lower_case)
  if(lower_case MATCHES "</(style|script)|<!--|{{|\\)page\"")
    message(FATAL_ERROR "${part} holds \"${CMAKE_MATCH_0}\", which ends or changes what is around it")
  endif()
  file(SHA256 ${FOLDER}/${part} hash)
  base64_of_sha256(${hash} hash)
  string(REPLACE "@${name}_hash@" "sha256-${hash}" page "${page}")
  string(REPLACE "@${name}@" "${text}" page "${page}")
endforeach()
file(WRITE ${OUTPUT} "// SPDX-License-Identifier: MIT
// Made of scanner/report/html/ by cmake/embed_page.cmake.
#include \"scanner/report/html_template.h\"

namespace scanner {

const char kHtmlTemplate[] = R\"page(${page})page\";

}  // namespace scanner
")
