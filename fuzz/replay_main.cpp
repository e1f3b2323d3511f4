// Runs a fuzz target over every file of the directories (or files) named on the command line, as
// libFuzzer would run its corpus, for builds without libFuzzer. Each file name is printed before
// its run, so when a target stops the program the last name printed is the input that did it.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <dirent.h>
#include <string>
#include <sys/stat.h>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

bool runFile(const std::string& path)
{
    FILE* f = std::fopen(path.c_str(), "rb");
    if (f == nullptr) {
        std::perror(path.c_str());
        return false;
    }
    std::vector<uint8_t> bytes;
    uint8_t buf[4096];
    size_t n;
    while ((n = std::fread(buf, 1, sizeof buf, f)) > 0) {
        bytes.insert(bytes.end(), buf, buf + n);
    }
    std::fclose(f);
    std::printf("replaying %s (%zu bytes)\n", path.c_str(), bytes.size());
    std::fflush(stdout);
    // libFuzzer never hands a target a null pointer, not even for an empty input.
    static const uint8_t none = 0;
    LLVMFuzzerTestOneInput(bytes.empty() ? &none : bytes.data(), bytes.size());
    return true;
}

} // namespace

int main(int argc, char** argv)
{
    size_t runs = 0;
    for (int i = 1; i < argc; ++i) {
        struct stat st {};
        if (stat(argv[i], &st) != 0) {
            std::perror(argv[i]);
            return 1;
        }
        if (!S_ISDIR(st.st_mode)) {
            if (!runFile(argv[i])) {
                return 1;
            }
            ++runs;
            continue;
        }
        DIR* dir = opendir(argv[i]);
        if (dir == nullptr) {
            std::perror(argv[i]);
            return 1;
        }
        std::vector<std::string> names;
        while (dirent* e = readdir(dir)) {
            if (e->d_name[0] != '.') {
                names.emplace_back(e->d_name);
            }
        }
        closedir(dir);
        // A fixed order, so that a failure reproduces the same way on every machine.
        std::sort(names.begin(), names.end());
        for (const std::string& name : names) {
            if (!runFile(std::string(argv[i]) + "/" + name)) {
                return 1;
            }
            ++runs;
        }
    }
    std::printf("replayed %zu inputs\n", runs);
    return runs > 0 ? 0 : 1;
}
