# cmake -DINPUT=farm.toml -DOUTPUT=BuiltinFarm.cpp -P EmbedFarm.cmake
file(READ ${INPUT} hex HEX)
string(LENGTH "${hex}" hex_length)
math(EXPR byte_count "${hex_length} / 2")
string(REGEX REPLACE "([0-9a-f][0-9a-f])" "0x\\1," bytes "${hex}")
string(REGEX REPLACE "(0x..,0x..,0x..,0x..,0x..,0x..,0x..,0x..,0x..,0x..,0x..,0x..,)" "\\1\n    "
       bytes "${bytes}")
file(WRITE ${OUTPUT}.tmp
"// generated from farms/default.toml by EmbedFarm.cmake; do not edit
#include \"platform/farm/ActiveFarm.h\"

namespace farm {
namespace {
const unsigned char kBytes[${byte_count} + 1] = {
    ${bytes}0x00};
}  // namespace

std::string_view builtinFarmText() {
    return {reinterpret_cast<const char*>(kBytes), ${byte_count}};
}
}  // namespace farm
")
file(COPY_FILE ${OUTPUT}.tmp ${OUTPUT} ONLY_IF_DIFFERENT)
file(REMOVE ${OUTPUT}.tmp)
