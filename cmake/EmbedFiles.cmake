# Run as a script: writes the page's files into the C++ source OUTPUT, each as one raw string literal.
#   cmake -DOUTPUT=PageFiles.cpp -DFOLDER=page -P EmbedFiles.cmake index.html page.css ...
set(rows "")
math(EXPR last "${CMAKE_ARGC} - 1")
set(after_script FALSE)
foreach(i RANGE ${last})
    set(argument "${CMAKE_ARGV${i}}")
    if(after_script)
        file(READ "${FOLDER}/${argument}" content)
        string(APPEND rows "    {\"${argument}\", R\"page(${content})page\"},\n")
    elseif(argument MATCHES "EmbedFiles.cmake$")
        set(after_script TRUE)
    endif()
endforeach()
file(WRITE "${OUTPUT}" "#include \"PageFiles.h\"\n
namespace provider {
namespace {
constexpr PageFile kFiles[] = {
${rows}};
}  // namespace
const std::span<const PageFile> kPageFiles = kFiles;
}  // namespace provider
")
