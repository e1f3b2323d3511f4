// zmtool raw: inspects and transforms raw volume files (dense voxels, x fastest, no header) with
// the library's raw data functions.
//
// Every command reads the whole file (its size must match the dims, type and components given),
// works in memory and writes a new file through a temporary file in the target's directory that
// is renamed over the target only once it is complete: an interrupted or failed run leaves the
// old output (or, with --in-place, the input) as it was. Ctrl-C cancels through the progress
// interface, so long loops stop at their next step.
#include "TerminalProgress.h"
#include "zmtool.h"

#include <zmlib/ZmCoder.h>
#include <zmlib/ZmLibMD5Coder.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmPrimType.h>
#include <zmlib/ZmProgressInterface.h>
#include <zmlib/ZmRawData.h>
#include <zmlib/ZmString.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cinttypes>
#include <climits>
#include <cmath>
#include <csignal>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace {

// Exit statuses: 1 for a file that cannot be processed (unreadable, wrong size, a type the
// operation does not take, no memory), 2 for a bad command line, 130 for a run canceled by Ctrl-C
// (the shell's status of a process stopped by SIGINT).
const int kFailed = 1;
const int kUsage = 2;
const int kCanceled = 130;

// Files move through memory in pieces of this size, one progress step each.
const uint64_t kChunkBytes = uint64_t(64) << 20;

volatile std::sig_atomic_t g_interrupted = 0;

extern "C" void onInterrupt(int)
{
    g_interrupted = 1;
}

// Thrown after the message has been printed; carries the exit status.
struct Exit {
    int status;
};

const char* g_command = "raw";

[[noreturn]] __attribute__((format(printf, 2, 3))) void fail(int status, const char* format, ...)
{
    std::fflush(stdout);
    std::fprintf(stderr, "zmtool raw %s: ", g_command);
    va_list args;
    va_start(args, format);
    std::vfprintf(stderr, format, args);
    va_end(args);
    std::fputc('\n', stderr);
    throw Exit{status};
}

const char kUsageText[] =
    "usage: zmtool raw COMMAND FILE --dims X,Y,Z --type TYPE [--components N] [--big-endian]\n"
    "                  [-o OUT | --in-place] [OPTIONS]\n"
    "\n"
    "FILE holds X*Y*Z voxels of N values of TYPE (byte, short, int, float, double, complex,\n"
    "ushort, uint, sbyte), x fastest, no header; --big-endian when its values are stored most\n"
    "significant byte first. Outputs keep the input's byte order.\n"
    "\n"
    "commands:\n"
    "  info                                 dims, type, value range, constancy and MD5 of FILE\n"
    "  convert --to TYPE [--offset O] [--scale S]\n"
    "                                       values converted to TYPE (saturating); with O or S,\n"
    "                                       mapped as (value + O) * S in single precision\n"
    "  swap-bytes                           the byte order of every value reversed\n"
    "  flip --axis A                        mirrored along axis A (0 = x, 1 = y, 2 = z)\n"
    "  crop --min X,Y,Z --max X,Y,Z [--fill V]\n"
    "                                       the box min..max (inclusive, may reach outside the\n"
    "                                       volume; voxels outside get V, default 0)\n"
    "  permute --order A,B,C                axes reordered: new x is old axis A, new y B, new z C\n"
    "  downsample --block BX,BY,BZ [--labels]\n"
    "                                       block means (incomplete blocks dropped); --labels\n"
    "                                       takes the most frequent label, the lowest on a tie\n"
    "\n"
    "Every command but info writes -o OUT, or replaces FILE with --in-place; the output appears\n"
    "only when complete. Exit status: 0 done, 1 the file cannot be processed, 2 bad command\n"
    "line, 130 canceled (Ctrl-C).\n";

struct Options {
    std::string command;
    std::string input;
    std::string output;
    bool inPlace = false;
    bool haveDims = false;
    int dims[3] = {0, 0, 0};
    std::string type;
    int components = 1;
    bool bigEndian = false;
    // Per command.
    std::string to;
    bool mapping = false;
    double offset = 0;
    double scale = 1;
    int axis = -1;
    bool haveMin = false;
    bool haveMax = false;
    int boxMin[3] = {0, 0, 0};
    int boxMax[3] = {0, 0, 0};
    double fill = 0;
    bool haveOrder = false;
    int order[3] = {0, 1, 2};
    bool haveBlock = false;
    int block[3] = {1, 1, 1};
    bool labels = false;
};

long parseLong(const std::string& option, const char* text, long low, long high)
{
    errno = 0;
    char* end = nullptr;
    const long v = std::strtol(text, &end, 10);
    if (end == text || *end != 0 || errno != 0 || v < low || v > high) {
        fail(kUsage, "%s: '%s' is not a whole number from %ld to %ld", option.c_str(), text, low, high);
    }
    return v;
}

double parseDouble(const std::string& option, const char* text)
{
    char* end = nullptr;
    const double v = std::strtod(text, &end);
    if (end == text || *end != 0 || !std::isfinite(v)) {
        fail(kUsage, "%s: '%s' is not a finite number", option.c_str(), text);
    }
    return v;
}

// "X,Y,Z" into three ints from \p low to INT_MAX.
void parseTriple(const std::string& option, const char* text, long low, int out[3])
{
    std::string rest = text;
    for (int i = 0; i < 3; ++i) {
        const size_t comma = rest.find(',');
        if ((i < 2) != (comma != std::string::npos)) {
            fail(kUsage, "%s: '%s' is not three numbers X,Y,Z", option.c_str(), text);
        }
        out[i] = int(parseLong(option, rest.substr(0, comma).c_str(), low, INT_MAX));
        rest = i < 2 ? rest.substr(comma + 1) : "";
    }
}

// Which commands take an option; "*" for all, "+" for all that write.
struct OptionRule {
    const char* name;
    bool hasValue;
    const char* commands;
};

const OptionRule kOptionRules[] = {
    {"--dims", true, "*"},
    {"--type", true, "*"},
    {"--components", true, "*"},
    {"--big-endian", false, "*"},
    {"-o", true, "+"},
    {"--in-place", false, "+"},
    {"--to", true, " convert "},
    {"--offset", true, " convert "},
    {"--scale", true, " convert "},
    {"--axis", true, " flip "},
    {"--min", true, " crop "},
    {"--max", true, " crop "},
    {"--fill", true, " crop "},
    {"--order", true, " permute "},
    {"--block", true, " downsample "},
    {"--labels", false, " downsample "},
};

void applyOption(Options& o, const std::string& name, const char* value)
{
    if (name == "--dims") {
        parseTriple(name, value, 1, o.dims);
        o.haveDims = true;
    } else if (name == "--type") {
        o.type = value;
    } else if (name == "--components") {
        o.components = int(parseLong(name, value, 1, 65536));
    } else if (name == "--big-endian") {
        o.bigEndian = true;
    } else if (name == "-o") {
        o.output = value;
    } else if (name == "--in-place") {
        o.inPlace = true;
    } else if (name == "--to") {
        o.to = value;
    } else if (name == "--offset") {
        o.offset = parseDouble(name, value);
        o.mapping = true;
    } else if (name == "--scale") {
        o.scale = parseDouble(name, value);
        o.mapping = true;
    } else if (name == "--axis") {
        o.axis = int(parseLong(name, value, 0, 2));
    } else if (name == "--min" || name == "--max") {
        parseTriple(name, value, INT_MIN, name == "--min" ? o.boxMin : o.boxMax);
        (name == "--min" ? o.haveMin : o.haveMax) = true;
    } else if (name == "--fill") {
        o.fill = parseDouble(name, value);
    } else if (name == "--order") {
        parseTriple(name, value, 0, o.order);
        o.haveOrder = true;
        if (o.order[0] > 2 || o.order[1] > 2 || o.order[2] > 2 || o.order[0] == o.order[1] ||
            o.order[0] == o.order[2] || o.order[1] == o.order[2]) {
            fail(kUsage, "--order: '%s' is not an order of the axes 0, 1 and 2", value);
        }
    } else if (name == "--block") {
        parseTriple(name, value, 1, o.block);
        o.haveBlock = true;
    } else if (name == "--labels") {
        o.labels = true;
    }
}

Options parseArguments(int argc, char** argv)
{
    Options o;
    o.command = argv[0];
    const bool writes = o.command != "info";
    for (int i = 1; i < argc; ++i) {
        std::string arg = argv[i];
        if (arg == "--help" || arg == "-h") {
            std::fputs(kUsageText, stdout);
            throw Exit{0};
        }
        if (arg.size() < 2 || arg[0] != '-') {
            if (!o.input.empty()) {
                fail(kUsage, "more than one input file ('%s' and '%s')", o.input.c_str(), arg.c_str());
            }
            o.input = arg;
            continue;
        }
        // --name=value as well as --name value.
        const char* inlineValue = nullptr;
        const size_t eq = arg.find('=');
        if (arg.compare(0, 2, "--") == 0 && eq != std::string::npos) {
            inlineValue = argv[i] + eq + 1;
            arg.resize(eq);
        }
        const OptionRule* rule = nullptr;
        for (const OptionRule& r : kOptionRules) {
            rule = arg == r.name ? &r : rule;
        }
        if (rule == nullptr) {
            fail(kUsage, "unknown option '%s' (see zmtool raw --help)", arg.c_str());
        }
        const std::string spaced = " " + o.command + " ";
        if (!(rule->commands[0] == '*' || (rule->commands[0] == '+' && writes) ||
              std::strstr(rule->commands, spaced.c_str()) != nullptr)) {
            fail(kUsage, "option %s does not apply to %s", arg.c_str(), o.command.c_str());
        }
        const char* value = inlineValue;
        if (rule->hasValue && value == nullptr) {
            if (i + 1 >= argc) {
                fail(kUsage, "option %s needs a value", arg.c_str());
            }
            value = argv[++i];
        } else if (!rule->hasValue && value != nullptr) {
            fail(kUsage, "option %s takes no value", arg.c_str());
        }
        applyOption(o, arg, value);
    }
    if (o.input.empty() || !o.haveDims || o.type.empty()) {
        fail(kUsage, "needs FILE, --dims X,Y,Z and --type TYPE (see zmtool raw --help)");
    }
    if (writes && o.output.empty() == !o.inPlace) {
        fail(kUsage, "give either -o OUT or --in-place");
    }
    struct Required {
        const char* command;
        bool given;
        const char* option;
    };
    const Required required[] = {{"convert", !o.to.empty(), "--to TYPE"},
                                 {"flip", o.axis >= 0, "--axis A"},
                                 {"crop", o.haveMin && o.haveMax, "--min X,Y,Z and --max X,Y,Z"},
                                 {"permute", o.haveOrder, "--order A,B,C"},
                                 {"downsample", o.haveBlock, "--block BX,BY,BZ"}};
    for (const Required& r : required) {
        if (o.command == r.command && !r.given) {
            fail(kUsage, "needs %s", r.option);
        }
    }
    return o;
}

ZmPrimType typeNamed(const std::string& name)
{
    ZmPrimType::Type type = ZmPrimType::BYTE;
    if (!ZmPrimType::nameToType(name.c_str(), type)) {
        fail(kUsage, "unknown type '%s' (byte, short, int, float, double, complex, ushort, uint, sbyte)",
             name.c_str());
    }
    if (type == ZmPrimType::STRING) {
        fail(kUsage, "type string holds pointers, which a file cannot");
    }
    return type;
}

// A buffer from zmmalloc (crop replaces it with another one).
struct Buffer {
    void* data = nullptr;
    Buffer() = default;
    Buffer(const Buffer&) = delete;
    Buffer& operator=(const Buffer&) = delete;
    ~Buffer() { zmfree(data); }
    void allocate(uint64_t bytes)
    {
        try {
            zmfree(data);
            data = nullptr;
            data = zmmalloc(bytes);
        } catch (const ZmMemoryException&) {
            fail(kFailed, "out of memory (%" PRIu64 " bytes)", bytes);
        }
    }
    unsigned char* bytes() const { return static_cast<unsigned char*>(data); }
};

struct Volume {
    int dims[3] = {1, 1, 1};
    ZmPrimType type;
    int components = 1;
    Buffer buffer;

    uint64_t voxels() const { return uint64_t(dims[0]) * uint64_t(dims[1]) * uint64_t(dims[2]); }
    uint64_t values() const { return voxels() * uint64_t(components); }
    int voxelBytes() const { return type.size() * components; }
    uint64_t bytes() const { return values() * uint64_t(type.size()); }
    ZmTypedPointer typed() const { return ZmTypedPointer(buffer.data, type); }
};

std::string describe(const int dims[3], ZmPrimType type, int components, bool bigEndian)
{
    ZmString text(0, "%d x %d x %d %s", dims[0], dims[1], dims[2], type.getName());
    if (components > 1) {
        text += ZmString(0, ", %d components", components);
    }
    if (bigEndian) {
        text += ", big-endian";
    }
    return text.getString();
}

// The run's progress: an interface that the library's loops report to, shown on the terminal.
struct Run {
    Options options;
    ZmProgressInterface progress;
    zmtool::TerminalProgress display;

    Run() { progress.setProgressGui(&display); }
    ~Run() { progress.setProgressGui(nullptr); }
    Run(const Run&) = delete;
    Run& operator=(const Run&) = delete;

    void checkCanceled()
    {
        if (g_interrupted != 0 || progress.isCanceled()) {
            display.clear();
            fail(kCanceled, "canceled; %s left as it was",
                 options.inPlace ? options.input.c_str() : options.output.c_str());
        }
    }

    // Runs \p step over [0, count) in chunks as one task that moves \p bytes.
    template <class Step>
    void inChunks(const std::string& text, uint64_t count, uint64_t chunk, uint64_t bytes, Step step)
    {
        const uint64_t chunks = count == 0 ? 1 : (count + chunk - 1) / chunk;
        display.setTaskBytes(bytes);
        ProgressScope scope(&progress);
        progress.startWorking(int(chunks), text);
        for (uint64_t at = 0; at < count; at += chunk) {
            step(at, count - at < chunk ? count - at : chunk);
            progress.nextStep();
            checkCanceled();
        }
    }
};

void load(Run& run, Volume& v, ZmLib::MD5Coder* md5)
{
    const Options& o = run.options;
    v.type = typeNamed(o.type);
    v.components = o.components;
    std::memcpy(v.dims, o.dims, sizeof v.dims);
    uint64_t expected = 0;
    const bool fits = !__builtin_mul_overflow(v.voxels(), uint64_t(v.voxelBytes()), &expected) &&
                      expected <= uint64_t(INT64_MAX);
    const int fd = open(o.input.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        fail(kFailed, "%s: %s", o.input.c_str(), std::strerror(errno));
    }
    struct Closer {
        int fd;
        ~Closer() { close(fd); }
    } closer{fd};
    struct stat st {};
    if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        fail(kFailed, "%s: not a regular file", o.input.c_str());
    }
    if (!fits || uint64_t(st.st_size) != expected) {
        fail(kFailed, "%s: the file has %lld bytes, but %s take %s bytes", o.input.c_str(),
             static_cast<long long>(st.st_size), describe(v.dims, v.type, v.components, false).c_str(),
             fits ? std::to_string(expected).c_str() : "more than 2^63");
    }
    v.buffer.allocate(expected);
    run.inChunks("Reading " + o.input, expected, kChunkBytes, expected, [&](uint64_t at, uint64_t n) {
        errno = 0;
        if (ZmRawData::read(fd, v.buffer.bytes() + at, int64_t(n), true) != int64_t(n)) {
            fail(kFailed, "%s: %s", o.input.c_str(),
                 errno != 0 ? std::strerror(errno) : "file shrank while read");
        }
        if (md5 != nullptr) {
            md5->append(v.buffer.bytes() + at, n);
        }
    });
    if (o.bigEndian) {
        ZmRawData::swapBytes(v.typed(), v.values());
    }
}

// The output file, written under a temporary name beside it and renamed at the end; removed
// unless committed.
class TempOutput {
public:
    TempOutput(const std::string& target, const std::string& input, bool inPlace) : m_target(target)
    {
        const size_t slash = target.rfind('/');
        const std::string dir = slash == std::string::npos ? "." : target.substr(0, slash + 1);
        const std::string base = slash == std::string::npos ? target : target.substr(slash + 1);
        if (base.empty()) {
            fail(kUsage, "-o %s: names a directory", target.c_str());
        }
        // Replacing the input needs --in-place.
        struct stat in {};
        struct stat out {};
        const bool exists = stat(target.c_str(), &out) == 0;
        if (!inPlace && exists && stat(input.c_str(), &in) == 0 && in.st_dev == out.st_dev &&
            in.st_ino == out.st_ino) {
            fail(kUsage, "-o %s names the input; give --in-place to replace it", target.c_str());
        }
        if (exists && !S_ISREG(out.st_mode)) {
            fail(kFailed, "%s: exists and is not a regular file", target.c_str());
        }
        std::string pattern = (slash == std::string::npos ? "" : dir) + "." + base + ".zmtool-XXXXXX";
        m_fd = mkostemp(&pattern[0], O_CLOEXEC);
        if (m_fd < 0) {
            fail(kFailed, "%s: cannot create a file there: %s", dir.c_str(), std::strerror(errno));
        }
        m_temp = pattern;
        // A replaced file keeps its permissions; a new one gets the usual ones.
        mode_t mode = out.st_mode & 07777;
        if (!exists) {
            const mode_t mask = umask(0);
            umask(mask);
            mode = 0666 & ~mask;
        }
        fchmod(m_fd, mode);
    }
    TempOutput(const TempOutput&) = delete;
    TempOutput& operator=(const TempOutput&) = delete;
    ~TempOutput()
    {
        if (m_fd >= 0) {
            close(m_fd);
        }
        if (!m_committed) {
            unlink(m_temp.c_str());
        }
    }
    int fd() const { return m_fd; }
    const std::string& temp() const { return m_temp; }
    void commit()
    {
        const int fd = m_fd;
        m_fd = -1;
        if (close(fd) != 0) {
            fail(kFailed, "%s: %s", m_temp.c_str(), std::strerror(errno));
        }
        if (std::rename(m_temp.c_str(), m_target.c_str()) != 0) {
            fail(kFailed, "%s: %s", m_target.c_str(), std::strerror(errno));
        }
        m_committed = true;
    }

private:
    std::string m_target;
    std::string m_temp;
    int m_fd = -1;
    bool m_committed = false;
};

void save(Run& run, Volume& v, bool swapToFileOrder)
{
    const Options& o = run.options;
    run.checkCanceled();
    if (swapToFileOrder && o.bigEndian) {
        ZmRawData::swapBytes(v.typed(), v.values());
    }
    const std::string& target = o.inPlace ? o.input : o.output;
    TempOutput out(target, o.input, o.inPlace);
    run.inChunks("Writing " + target, v.bytes(), kChunkBytes, v.bytes(), [&](uint64_t at, uint64_t n) {
        if (ZmRawData::write(out.fd(), v.buffer.bytes() + at, n) != n) {
            fail(kFailed, "%s: %s", out.temp().c_str(), std::strerror(errno));
        }
    });
    run.checkCanceled();
    out.commit();
    std::printf("%s: %s\n", target.c_str(), describe(v.dims, v.type, v.components, o.bigEndian).c_str());
}

int info(Run& run)
{
    Volume v;
    ZmLib::MD5Coder md5;
    load(run, v, &md5);
    unsigned char digest[16];
    md5.finalize().getBytes(digest);
    ZmString hex;
    ZmCoder::dataToHexString(digest, 16, hex, false);
    const ZmPrimType t = v.type;
    const bool measurable = t != ZmPrimType::UINT && t != ZmPrimType::SBYTE;
    std::printf("file:       %s\n", run.options.input.c_str());
    std::printf("dims:       %d x %d x %d\n", v.dims[0], v.dims[1], v.dims[2]);
    std::printf("type:       %s (%d bytes), %d component%s\n", t.getName(), t.size(), v.components,
                v.components == 1 ? "" : "s");
    std::printf("byte order: %s\n", run.options.bigEndian ? "big-endian" : "little-endian");
    std::printf("size:       %" PRIu64 " bytes\n", v.bytes());
    if (measurable) {
        float low = 0;
        float high = 0;
        ZmRawData::getRange(v.typed(), v.values(), low, high);
        std::printf("range:      %.9g .. %.9g\n", double(low), double(high));
        std::printf("constant:   %s\n", ZmRawData::isConstant(v.typed(), v.values()) ? "yes" : "no");
    } else {
        std::printf("range:      not measured for %s\n", t.getName());
    }
    std::printf("md5:        %s\n", hex.getString());
    return 0;
}

int convert(Run& run)
{
    Volume in;
    load(run, in, nullptr);
    const Options& o = run.options;
    const ZmPrimType to = typeNamed(o.to);
    const ZmPrimType from = in.type;
    if (from != to) {
        if (from == ZmPrimType::COMPLEX && (!o.mapping || to != ZmPrimType::COMPLEX)) {
            fail(kFailed, "complex values convert only to complex");
        }
        if (!o.mapping && to == ZmPrimType::COMPLEX) {
            fail(kFailed, "real values become complex only with --offset or --scale");
        }
        if (!o.mapping && (to == ZmPrimType::UINT || to == ZmPrimType::SBYTE)) {
            fail(kFailed, "conversion to %s needs --offset or --scale", to.getName());
        }
    }
    Volume out;
    std::memcpy(out.dims, in.dims, sizeof out.dims);
    out.type = to;
    out.components = in.components;
    out.buffer.allocate(out.bytes());
    const uint64_t chunkValues = kChunkBytes / 8;
    run.inChunks("Converting", in.values(), chunkValues, in.bytes(), [&](uint64_t at, uint64_t n) {
        const ZmTypedPointer dst(out.buffer.bytes() + at * uint64_t(to.size()), to);
        const ZmTypedPointer src(in.buffer.bytes() + at * uint64_t(from.size()), from);
        if (o.mapping) {
            ZmRawData::mapLinear(dst, src, n, o.offset, o.scale);
        } else {
            ZmRawData::memcpy(dst, src, int64_t(n));
        }
    });
    save(run, out, true);
    return 0;
}

int swapBytes(Run& run)
{
    Volume v;
    const bool bigEndian = run.options.bigEndian;
    run.options.bigEndian = false; // taken as stored, reversed as a whole
    load(run, v, nullptr);
    ZmRawData::swapBytes(v.typed(), v.values());
    run.options.bigEndian = !bigEndian;
    save(run, v, false);
    return 0;
}

int flip(Run& run)
{
    Volume v;
    load(run, v, nullptr);
    if (ZmRawData::flip(v.buffer.data, v.voxelBytes(), v.dims, run.options.axis) != 1) {
        fail(kFailed, "out of memory");
    }
    save(run, v, true);
    return 0;
}

// The fill voxel: every component holds the fill value converted to the volume's type.
void fillVoxel(const Volume& v, double fill, Buffer& voxel)
{
    voxel.allocate(uint64_t(v.voxelBytes()));
    const ZmPrimType t = v.type;
    for (int c = 0; c < v.components; ++c) {
        const ZmTypedPointer dst(voxel.bytes() + c * t.size(), t);
        if (t == ZmPrimType::COMPLEX) {
            const float parts[2] = {float(fill), 0.0f};
            std::memcpy(dst.data(), parts, sizeof parts);
        } else if (t == ZmPrimType::UINT || t == ZmPrimType::SBYTE) {
            ZmRawData::mapLinear(dst, ZmTypedPointer(&fill), 1, 0.0, 1.0);
        } else {
            ZmRawData::memcpy(dst, ZmTypedPointer(&fill), 1);
        }
    }
}

int crop(Run& run)
{
    const Options& o = run.options;
    for (int a = 0; a < 3; ++a) {
        if (o.boxMax[a] < o.boxMin[a]) {
            fail(kUsage, "the box is empty along axis %d (max %d below min %d)", a, o.boxMax[a], o.boxMin[a]);
        }
        if (int64_t(o.boxMax[a]) - int64_t(o.boxMin[a]) >= int64_t(INT_MAX)) {
            fail(kUsage, "the box is wider than %d voxels along axis %d", INT_MAX, a);
        }
    }
    Volume v;
    load(run, v, nullptr);
    Buffer voxel;
    fillVoxel(v, o.fill, voxel);
    if (ZmRawData::crop(v.buffer.data, v.voxelBytes(), v.dims, o.boxMin, o.boxMax, voxel.data) != 1) {
        fail(kFailed, "out of memory for the box");
    }
    save(run, v, true);
    return 0;
}

int permute(Run& run)
{
    Volume v;
    load(run, v, nullptr);
    // Voxels move whole, so any type permutes as the plain type of its size.
    static const ZmPrimType::Type kBySize[9] = {ZmPrimType::BYTE, ZmPrimType::BYTE, ZmPrimType::SHORT,
                                                ZmPrimType::BYTE, ZmPrimType::INT,  ZmPrimType::BYTE,
                                                ZmPrimType::BYTE, ZmPrimType::BYTE, ZmPrimType::DOUBLE};
    const ZmTypedPointer moved(v.buffer.data, kBySize[v.type.size()]);
    if (!ZmRawData::swapDims(moved, v.dims, run.options.order, v.components)) {
        fail(kFailed, "out of memory for the permutation");
    }
    save(run, v, true);
    return 0;
}

int downsample(Run& run)
{
    const Options& o = run.options;
    Volume in;
    load(run, in, nullptr);
    const ZmPrimType t = in.type;
    if (o.labels && (!t.isInteger() || in.components != 1)) {
        fail(kFailed, "--labels needs one component of an integer type");
    }
    if (!o.labels && (t == ZmPrimType::COMPLEX || t == ZmPrimType::UINT || t == ZmPrimType::SBYTE)) {
        fail(kFailed, "block means are not available for %s", t.getName());
    }
    Volume out;
    out.type = t;
    out.components = in.components;
    for (int a = 0; a < 3; ++a) {
        out.dims[a] = in.dims[a] / o.block[a];
        if (out.dims[a] < 1) {
            fail(kFailed, "the block (%d along axis %d) is larger than the volume (%d)", o.block[a], a,
                 in.dims[a]);
        }
    }
    out.buffer.allocate(out.bytes());
    run.display.setTaskBytes(in.bytes());
    const uint64_t n[3] = {uint64_t(in.dims[0]), uint64_t(in.dims[1]), uint64_t(in.dims[2])};
    if (o.labels) {
        ZmRawData::downSampleLabels3D(out.buffer.data, in.typed(), n[0], n[1], n[2], o.block[0], o.block[1],
                                      o.block[2], &run.progress);
    } else {
        ZmRawData::downSample3DN(out.buffer.data, in.typed(), n[0], n[1], n[2], o.block[0], o.block[1],
                                 o.block[2], in.components, &run.progress);
    }
    save(run, out, true);
    return 0;
}

} // namespace

int zmtool::runRaw(int argc, char** argv)
{
    if (argc < 1 || std::strcmp(argv[0], "--help") == 0 || std::strcmp(argv[0], "-h") == 0) {
        std::fputs(kUsageText, argc < 1 ? stderr : stdout);
        return argc < 1 ? kUsage : 0;
    }
    g_command = argv[0];
    // Ctrl-C sets a flag that the progress steps turn into a cancel; a second one ends the process
    // at once. A SIGINT ignored by whoever started us (a background job) stays ignored.
    struct sigaction old {};
    sigaction(SIGINT, nullptr, &old);
    if (old.sa_handler != SIG_IGN) {
        struct sigaction action {};
        action.sa_handler = onInterrupt;
        action.sa_flags = SA_RESETHAND;
        sigemptyset(&action.sa_mask);
        sigaction(SIGINT, &action, nullptr);
        sigset_t interrupt;
        sigemptyset(&interrupt);
        sigaddset(&interrupt, SIGINT);
        sigprocmask(SIG_UNBLOCK, &interrupt, nullptr);
    }
    struct Entry {
        const char* name;
        int (*run)(Run&);
    };
    static const Entry kEntries[] = {
        {"info", info}, {"convert", convert}, {"swap-bytes", swapBytes}, {"flip", flip},
        {"crop", crop}, {"permute", permute}, {"downsample", downsample}};
    try {
        const Entry* entry = nullptr;
        for (const Entry& e : kEntries) {
            entry = std::strcmp(argv[0], e.name) == 0 ? &e : entry;
        }
        if (entry == nullptr) {
            fail(kUsage, "unknown command (see zmtool raw --help)");
        }
        Run run;
        run.options = parseArguments(argc, argv);
        run.display.watchInterrupt(&g_interrupted);
        const int status = entry->run(run);
        if (std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
            fail(kFailed, "write error on standard output");
        }
        return status;
    } catch (const Exit& e) {
        return e.status;
    }
}
