# Puts page.css and page.js into page.html, and that into a header. Needs SOURCE (this folder) and OUTPUT.
file(READ ${SOURCE}/page.html page_html)
file(READ ${SOURCE}/page.css page_css)
file(READ ${SOURCE}/page.js page_js)
string(REPLACE "/*STYLE*/" "${page_css}" page_html "${page_html}")
string(REPLACE "/*SCRIPT*/" "${page_js}" page_html "${page_html}")
configure_file(${SOURCE}/page_template.hpp.in ${OUTPUT} @ONLY)
