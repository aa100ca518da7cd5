# Puts page.css and page.js into page.html, with the hashes by which alone a browser runs them, and that into a header.
# Needs SOURCE (this folder) and OUTPUT.

# A Content-Security-Policy's source expression for the text of an inline element: its SHA-256 in base 64.
function(hash_source OUT TEXT)
  set(alphabet ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/)
  string(SHA256 hex "${TEXT}")
  set(base64 "")
  foreach(group RANGE 0 10) # of six hexadecimal digits; the last has four
    math(EXPR at "${group} * 6")
    string(SUBSTRING "${hex}00" ${at} 6 digits)
    math(EXPR bits "0x${digits}")
    foreach(shift 18 12 6 0)
      math(EXPR index "(${bits} >> ${shift}) & 63")
      string(SUBSTRING ${alphabet} ${index} 1 letter)
      string(APPEND base64 ${letter})
    endforeach()
  endforeach()
  string(SUBSTRING ${base64} 0 43 base64)
  set(${OUT} "'sha256-${base64}='" PARENT_SCOPE)
endfunction()

file(READ ${SOURCE}/page.html page_html)
file(READ ${SOURCE}/page.css page_css)
file(READ ${SOURCE}/page.js page_js)
hash_source(style_source "\n${page_css}\n")
hash_source(script_source "\n${page_js}\n")
string(REPLACE "STYLE_SOURCE" "${style_source}" page_html "${page_html}")
string(REPLACE "SCRIPT_SOURCE" "${script_source}" page_html "${page_html}")
string(REPLACE "/*STYLE*/" "${page_css}" page_html "${page_html}")
string(REPLACE "/*SCRIPT*/" "${page_js}" page_html "${page_html}")
configure_file(${SOURCE}/page_template.hpp.in ${OUTPUT} @ONLY)
