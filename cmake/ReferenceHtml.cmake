# The pages of the class reference as HTML: every FROM/<page>.md becomes TO/<page>.html, and links follow.
#
#   cmake -D CMARK=<cmark-gfm> -D FROM=<folder> -D TO=<folder> -P ReferenceHtml.cmake
set(HEAD [[<!DOCTYPE html>
<html lang="en">
<head>
<meta charset="utf-8">
<meta name="viewport" content="width=device-width, initial-scale=1">
<title>@title@</title>
<style>
body { max-width: 72em; margin: 0 auto; padding: 1em 1.5em 4em; font: 16px/1.5 system-ui, sans-serif; color: #222; background: #fff; }
h1, h2, h3 { line-height: 1.2; } h2 { margin-top: 2em; }
table { border-collapse: collapse; margin: 1em 0; } td, th { padding: .3em .7em; border: 1px solid #ccc; text-align: left; vertical-align: top; }
th { background: #f2f2f2; } th:empty { display: none; } code { background: #f2f2f2; padding: 0 .2em; } a { color: #0550ae; }
@media (prefers-color-scheme: dark) { body { color: #ddd; background: #181818; } td, th { border-color: #444; } th, code { background: #2a2a2a; } a { color: #79b8ff; } }
</style>
</head>
<body>
]])

file(REMOVE_RECURSE ${TO})
file(MAKE_DIRECTORY ${TO})
file(GLOB pages ${FROM}/*.md)
foreach(page ${pages})
  get_filename_component(name ${page} NAME_WE)
  # The pages are our own: the places that links lead to are HTML in them.
  execute_process(COMMAND ${CMARK} --unsafe -e table ${page} OUTPUT_VARIABLE body RESULT_VARIABLE result)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "${CMARK} could not read ${page}: ${result}")
  endif()
  string(REGEX MATCH "<h1>([^<]*)</h1>" heading "${body}")
  set(title "${CMAKE_MATCH_1}")
  string(REGEX REPLACE "href=\"([A-Za-z0-9_]+)\\.md" "href=\"\\1.html" body "${body}")
  string(CONFIGURE "${HEAD}" head @ONLY)
  file(WRITE ${TO}/${name}.html "${head}${body}</body>\n</html>\n")
endforeach()
