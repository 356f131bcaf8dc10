# Turns a text file into a C++ source defining it as a string_view.
# Usage: cmake -DINPUT=file -DOUTPUT=file.cc -DNAME=kName -DHEADER=dir/x.h -P embed_text.cmake
file(READ "${INPUT}" text)
file(WRITE "${OUTPUT}.tmp"
  "// Generated from ${INPUT}.\n"
  "#include \"${HEADER}\"\n\n"
  "namespace cwtool {\n\n"
  "const std::string_view ${NAME} = R\"embedded_text(${text})embedded_text\";\n\n"
  "}  // namespace cwtool\n")
# Unchanged text leaves the source, and so the object, untouched.
file(COPY_FILE "${OUTPUT}.tmp" "${OUTPUT}" ONLY_IF_DIFFERENT)
file(REMOVE "${OUTPUT}.tmp")
