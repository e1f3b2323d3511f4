// Fuzzes the reader of the parameter-tree text form, HxParamBundle::parse.
//
// The whole input, zero bytes included, is the text. Any input must be read or refused with a
// line and column, without a crash, a hang or unbounded memory. Checks:
// - a refusal leaves the bundle as it was, and its message starts with "line ";
// - a tree that was read prints to a text that reads back and prints the same (both the string
//   form and the FILE form with its commas), so printing after reading is a fixed point.
#include "../tests/BundleText.h"
#include "FuzzCheck.h"

#include <zmlib/HxParamBundle.h>
#include <zmlib/ZmString.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    HxParamBundle tree("Untouched");
    tree.set("v", 1);
    const std::string before = printed(tree);
    const ZmResult r = tree.parse(reinterpret_cast<const char*>(data), size);
    if (!r.ok()) {
        FUZZ_CHECK(std::strncmp(r.text(), "line ", 5) == 0);
        FUZZ_CHECK(printed(tree) == before);
        return 0;
    }
    const std::string text = printed(tree);
    for (const std::string& form : {text, printedToFile(tree)}) {
        HxParamBundle again("Again");
        FUZZ_CHECK(again.parse(form.data(), form.size()).ok());
        FUZZ_CHECK(printed(again) == text);
    }
    return 0;
}
