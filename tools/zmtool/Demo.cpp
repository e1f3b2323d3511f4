// zmtool demo: an end-to-end walk through the library on built-in sample data. Each subsystem adds
// a section; a section prints what it did and returns false if something did not come out as the
// library promises, which makes the demo exit non-zero.
#include "zmtool.h"

#include <zmlib/zmlib.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <string>

namespace {

void heading(const char* title)
{
    std::printf("\n== %s ==\n", title);
}

// A header line as an acquisition export writes it: blanks separate fields, quotes keep blanks
// inside a field, a backslash outside quotes escapes the next byte (inside quotes every byte is
// taken as it is).
const char kHeaderLine[] = "PATIENT \"Doe^Jane\" STUDY \"CT chest, low dose\" NOTE \\\"draft\\\" SLICES 212 "
                           "SPACING 0.625 WINDOW \"-600 1500\" FILE scan\\ 01.raw";

const char* const kFileNames[] = {"IM_0001.dcm",     "IM_0002.dcm", "IM_0010.DCM",     "scan_01.raw",
                                  "scan_01.raw.md5", "report.txt",  "IM_0003.dcm.bak", "localizer.dcm"};

const char* const kPatterns[] = {"IM_*.dcm", "*.raw", "IM_000?.dcm", "*.dcm*", "scan_??.*"};

const char* const kNumberTexts[] = {"512", "0x200", "-0.625", "1e-3", "017", "12 ", "", "3.5mm", "NaN", "0x"};

bool demoStrings()
{
    heading("strings: splitting a quoted header line");
    std::printf("line: %s\n", kHeaderLine);
    ZmStringTokenizer tokens(kHeaderLine);
    ZmDArray<ZmString> fields;
    while (tokens.hasMoreTokens()) {
        fields.append(tokens.nextToken());
    }
    for (int64_t i = 0; i + 1 < fields.size(); i += 2) {
        std::printf("  %-8s = %s\n", fields[i].getString(), fields[i + 1].getString());
    }
    // Writing the fields back with protect() and splitting again must give the same fields.
    ZmString rebuilt;
    for (const ZmString& f : fields) {
        if (!rebuilt.isEmptyString()) {
            rebuilt += ' ';
        }
        rebuilt += f.protect(false);
    }
    ZmStringTokenizer again(rebuilt);
    bool same = true;
    for (const ZmString& f : fields) {
        same = same && again.hasMoreTokens() && again.nextToken() == f;
    }
    same = same && !again.hasMoreTokens();
    std::printf("protected again: %s\n  round trip %s\n", rebuilt.getString(), same ? "ok" : "FAILED");

    heading("strings: matching file names against wildcards");
    for (const char* pattern : kPatterns) {
        ZmString hits;
        for (const char* name : kFileNames) {
            if (zmWildMatch(name, pattern) != 0) {
                hits += hits.isEmptyString() ? "" : ", ";
                hits += name;
            }
        }
        std::printf("  %-12s -> %s\n", pattern, hits.isEmptyString() ? "(none)" : hits.getString());
    }

    heading("strings: parsing numbers");
    int notNumbers = 0;
    for (const char* text : kNumberTexts) {
        bool isLong = false;
        bool isDouble = false;
        const long l = StringUtils::toLong(text, 0, &isLong);
        const double d = StringUtils::toDouble(text, 0.0, &isDouble);
        ZmString quoted(0, "\"%s\"", text);
        if (isLong) {
            std::printf("  %-8s integer %ld\n", quoted.getString(), l);
        } else if (isDouble) {
            std::printf("  %-8s real    %g\n", quoted.getString(), d);
        } else {
            std::printf("  %-8s not a number\n", quoted.getString());
            ++notNumbers;
        }
    }
    std::printf("  %d of %zu texts are not numbers\n", notNumbers,
                sizeof kNumberTexts / sizeof *kNumberTexts);
    return same;
}

// A worker job: splits the header line and sums its field lengths, reporting to the log.
class FieldCounter : public ZmWorkerThread {
public:
    FieldCounter() : ZmWorkerThread("zmtool demo worker") {}
    ~FieldCounter() override { terminate(); }
    int fields = 0;
    int64_t characters = 0;

protected:
    void compute() override
    {
        ZmStringTokenizer tokens(kHeaderLine);
        while (tokens.hasMoreTokens()) {
            characters += tokens.nextToken().length();
            ++fields;
        }
        getTheLogInstance().tracef(ZmLogInfo, "demo", "worker thread %lu: %d fields, %lld characters",
                                   kvCurrentThreadId(), fields, static_cast<long long>(characters));
    }
};

bool demoCore()
{
    heading("results: an error record and the thread's last error");
    const ZmResult missing = KV_ERROR(ZmResult::ReadFileFailed, "sample.raw");
    std::printf("  code %d, text \"%s\"\n", missing.codeValue(), missing.text());
    Kv::fail(missing);
    const bool kept = Kv::lastError(false).error() == missing.error();
    std::printf("  written to the log; last error of this thread %s\n", kept ? "kept" : "LOST");

    heading("threads: a worker thread runs a job");
    FieldCounter worker;
    const bool started = worker.start(true);
    // The same count on this thread, for comparison.
    int fields = 0;
    for (ZmStringTokenizer tokens(kHeaderLine); tokens.hasMoreTokens(); tokens.nextToken()) {
        ++fields;
    }
    worker.terminate();
    const bool counted = started && worker.fields == fields && worker.jobsCompleted() == 1;
    std::printf("  worker \"%s\" counted %d fields (%lld characters): %s\n", worker.name().getString(),
                worker.fields, static_cast<long long>(worker.characters), counted ? "ok" : "FAILED");

    heading("files: a temporary directory");
    ZmString made;
    bool removed = false;
    {
        ZmTmpDir dir("zmtool-demo", true, true);
        made = dir;
        for (const char* name : {"IM_0001.dcm", "IM_0002.dcm", "scan_01.raw"}) {
            ZmFilename file(dir);
            file.appendFile(name);
            file.create(0644);
        }
        ZmDArray<ZmString> names;
        ZmDirectory::scanSortedByName(dir.str(), names, "*.dcm", false);
        std::printf("  made %s with 3 files; *.dcm:", dir.str());
        for (const ZmString& name : names) {
            std::printf(" %s", name.getString());
        }
        std::printf("\n");
    }
    removed = !ZmFilename(made).doesExist();
    std::printf("  removed with its contents: %s\n", removed ? "yes" : "NO");
    return kept && counted && removed;
}

bool demoFingerprints()
{
    heading("fingerprints: MD5 and CRC of the header line");
    const auto* bytes = reinterpret_cast<const unsigned char*>(kHeaderLine);
    const unsigned n = unsigned(sizeof kHeaderLine - 1);
    ZmLib::MD5Coder whole;
    whole.append(bytes, n);
    const ZmLib::MD5 digest = whole.finalize();
    // The same bytes fed in pieces of 7 must give the same digest.
    ZmLib::MD5Coder pieces;
    for (unsigned at = 0; at < n; at += 7) {
        pieces.append(bytes + at, n - at < 7 ? n - at : 7);
    }
    const bool same = pieces.finalize() == digest;
    ZmString hex;
    digest.toString(hex);
    std::printf("  MD5  %s (fed whole and in pieces of 7: %s)\n", hex.getString(),
                same ? "same" : "DIFFERENT");
    std::printf("  CRC  %u over %u bytes (as cksum computes it)\n", ZmCoder::crc(bytes, n), n);
    // A list of the digests of each field, combined into one fingerprint of the header.
    ZmLib::MD5List fields(true);
    for (ZmStringTokenizer tokens(kHeaderLine); tokens.hasMoreTokens();) {
        ZmLib::MD5Coder field;
        field << tokens.nextToken();
        fields.insert(field.finalize());
    }
    fields.hash().toString(hex);
    std::printf("  %lld field digests combined: %s\n", static_cast<long long>(fields.values().size()),
                hex.getString());
    std::printf("  a new identifier for this run: %s\n",
                ZmUUID::generateUUID().toFormattedString().getString());
    return same;
}

void printVec(const char* label, const ZmVec3f& v)
{
    std::printf("  %-28s (%8.3f, %8.3f, %8.3f)\n", label, v[0], v[1], v[2]);
}

bool demoGeometry()
{
    heading("geometry: an oblique coronal view, its letters and a picking ray");
    // A CT volume of 512 x 512 x 212 voxels of 0.7 x 0.7 x 0.625 mm, in patient coordinates
    // (+x left, +y posterior, +z head).
    const ZmBox3f volume(ZmVec3f(0.0f), ZmVec3f(512 * 0.7f, 512 * 0.7f, 212 * 0.625f));
    const ZmVec3f centre = (volume.getMin() + volume.getMax()) * 0.5f;

    // Screen to patient, row vectors: screen x goes to the patient's left, screen y (down) to the
    // feet, screen z (into the screen) to posterior; then the view is tilted by 20 degrees about
    // the patient's left-right axis and centred on the volume.
    ZmMat4f view(1, 0, 0, 0, 0, 0, -1, 0, 0, 1, 0, 0, 0, 0, 0, 1);
    ZmMat4f tilt;
    tilt.setRotate(ZmRotation(ZmVec3f(1, 0, 0), 20.0f * 3.14159265f / 180.0f));
    ZmMat4f move;
    move.setTranslate(centre);
    view *= tilt;
    view *= move;
    std::printf("  screen-to-patient matrix (rows; a point p maps to p * M):\n");
    for (int r = 0; r < 4; ++r) {
        std::printf("    %9.4f %9.4f %9.4f %9.4f\n", view[r][0], view[r][1], view[r][2], view[r][3]);
    }
    const ZmOrientationLetters letters(view);
    const char* viewClass = letters.isAxial() ? "axial" : letters.isCoronal() ? "coronal" : "sagittal";
    std::printf("  edge letters right/top/left/bottom: %s, a %s view\n", letters.join('/').c_str(),
                viewClass);
    const bool lettersOk = letters.isValid() && letters.right() == "L" && letters.bottom() == "F";

    ZmMat4f product = view;
    product *= view.inverse();
    const bool inverseOk = product.equals(ZmMat4f::identity(), 1e-5f);
    std::printf("  M times its inverse is the identity within 1e-5: %s\n", inverseOk ? "yes" : "NO");

    // Pick the screen point (40, -25) mm from the centre: a ray into the screen through the volume.
    const ZmVec3f picked = view.multVecMatrix(ZmVec3f(40, -25, 0));
    ZmLine ray;
    ray.setPosDir(picked, view.multDirMatrix(ZmVec3f(0, 0, 1)));
    printVec("picked point (patient mm)", picked);
    printVec("ray direction", ray.getDirection());
    ZmVec3f enter, exit;
    const bool hit = ray.intersect(volume, enter, exit, 0.0f);
    bool pickOk = hit;
    if (hit) {
        printVec("enters the volume at", enter);
        printVec("leaves it at", exit);
        std::printf("  path through the volume: %.2f mm\n", (exit - enter).length());
        // The plane of the middle axial slice cuts the ray between the two points.
        const ZmPlane midSlice(ZmVec3f(0, 0, 1), centre);
        ZmVec3f onSlice;
        float t = 0;
        pickOk = midSlice.intersect(ray, onSlice, &t) && std::fabs(midSlice.getDistance(onSlice)) < 1e-3f;
        printVec("crosses the middle slice at", onSlice);
        // The sphere around the volume holds the whole path through it.
        ZmSphere bound;
        bound.circumscribe(volume);
        ZmVec3f nearPoint, farPoint;
        pickOk = pickOk && bound.intersect(ray, nearPoint, farPoint) &&
                 (farPoint - nearPoint).length() >= (exit - enter).length();
        std::printf("  bounding sphere radius %.2f mm, its chord %.2f mm\n", bound.getRadius(),
                    (farPoint - nearPoint).length());
    } else {
        std::printf("  the ray MISSED the volume\n");
    }
    return lettersOk && inverseOk && pickOk;
}

void printProcessFigures()
{
    heading("process: this process's memory figures");
    const ZmProcessInfo self{int64_t(kvCurrentProcessId())};
    if (!self.found()) {
        std::printf("  not available\n");
        return;
    }
    const double mib = 1024.0 * 1024.0;
    std::printf("  working set %.1f MiB (peak %.1f MiB), committed %.1f MiB (peak %.1f MiB)\n",
                double(self.workingSetSize()) / mib, double(self.peakWorkingSetSize()) / mib,
                double(self.pagefileUsage()) / mib, double(self.peakPagefileUsage()) / mib);
}

} // namespace

// Prints a run's progress as a row of percentages, one for each quarter reached.
class QuarterProgress : public ZmProgressGuiInterface {
public:
    void showText(const std::string& text) override { std::printf("  %s:", text.c_str()); }
    void setMaximum(int maximum) override { m_maximum = maximum; }
    void setValue(int value) override
    {
        while (m_maximum > 0 && m_next <= 4 && int64_t(value) * 4 >= int64_t(m_maximum) * m_next) {
            std::printf(" %d%%", 25 * m_next++);
        }
    }
    void setCompleted(const ZmResult& result) override
    {
        std::printf(" (%s)\n", result.ok() ? "done" : result.text());
    }

private:
    int m_maximum = 0;
    int m_next = 1;
};

std::string md5Of(const void* data, uint64_t bytes)
{
    ZmLib::MD5Coder coder;
    coder.append(data, bytes);
    ZmString hex;
    coder.finalize().toString(hex);
    return hex.getString();
}

// A CT-like volume in Hounsfield units: air around an elliptic body of soft tissue, two lungs, a
// spine, and noise from a fixed-seed generator, so that the fingerprint is the same on every run.
void syntheticCt(short* voxels, int nx, int ny, int nz)
{
    uint32_t state = 12345;
    for (int z = 0; z < nz; ++z) {
        for (int y = 0; y < ny; ++y) {
            for (int x = 0; x < nx; ++x) {
                const double u = (x - nx / 2.0) / (nx * 0.42);
                const double v = (y - ny / 2.0) / (ny * 0.30);
                const double lung = std::min(std::hypot(std::fabs(u) - 0.45, v * 1.2), 1.0);
                const double spine = std::hypot(u * 6, (v - 0.65) * 5);
                double hu = -1000;
                if (u * u + v * v < 1) {
                    hu = lung < 0.35 ? -820 : (spine < 1 ? 700 : 40);
                }
                state = state * 1664525u + 1013904223u;
                voxels[(int64_t(z) * ny + y) * nx + x] = short(hu + int(state >> 27) - 16);
            }
        }
    }
}

bool demoRawData()
{
    heading("raw data: a synthetic CT volume, down-sampled and permuted");
    const int n[3] = {256, 256, 128};
    ZmRawData3D ct(n[0], n[1], n[2], 2);
    short* voxels = static_cast<short*>(ct.dataPtr());
    syntheticCt(voxels, n[0], n[1], n[2]);
    const uint64_t count = uint64_t(ct.getNumElems());
    float low = 0;
    float high = 0;
    ZmRawData::getRange(voxels, count, low, high);
    const std::string fingerprint = md5Of(voxels, count * 2);
    std::printf("  %d x %d x %d short, range %g .. %g HU, MD5 %s\n", n[0], n[1], n[2], double(low),
                double(high), fingerprint.c_str());

    // 2x2x2 block means, reported a quarter at a time.
    ZmRawData3D small(n[0] / 2, n[1] / 2, n[2] / 2, 2);
    ZmProgressInterface progress;
    QuarterProgress display;
    progress.setProgressGui(&display);
    ZmRawData::downSample3D(small.dataPtr(), voxels, uint64_t(n[0]), uint64_t(n[1]), uint64_t(n[2]), 2, 2, 2,
                            &progress);
    float smallLow = 0;
    float smallHigh = 0;
    ZmRawData::getRange(static_cast<short*>(small.dataPtr()), uint64_t(small.getNumElems()), smallLow,
                        smallHigh);
    const bool within = smallLow >= low && smallHigh <= high;
    std::printf("  down-sampled 2x2x2: %d x %d x %d, range %g .. %g HU (within the original: %s)\n",
                small.sizeX(), small.sizeY(), small.sizeZ(), double(smallLow), double(smallHigh),
                within ? "yes" : "NO");

    // z becomes the fastest axis (each line a column through the slices), and back again.
    int dims[3] = {n[0], n[1], n[2]};
    const int order[3] = {2, 0, 1};
    const int back[3] = {1, 2, 0};
    const bool permuted = ZmRawData::swapDims(voxels, dims, order, 1);
    const std::string permutedPrint = md5Of(voxels, count * 2);
    std::printf("  permuted to axes (z, x, y): %d x %d x %d, MD5 %s\n", dims[0], dims[1], dims[2],
                permutedPrint.c_str());
    const bool restored =
        permuted && ZmRawData::swapDims(voxels, dims, back, 1) && md5Of(voxels, count * 2) == fingerprint;
    std::printf("  permuted back: %s\n", restored ? "same fingerprint as before" : "DIFFERENT");
    return within && restored && permutedPrint != fingerprint;
}

bool demoBundles()
{
    heading("parameter bundles: a DICOM-like header");
    HxParamBundle header("CT_Chest");
    header.setTag("G0008-0060", "CT");
    header.setTag("G0028-0030", "0.625\\0.625");
    header.setTag("G0018-0050", "1.25");
    header.dicomAll()->setPrivateTagInAll("ACME Recon 2", "G0029-xx10", "soft tissue kernel");
    const float size[3] = {0.625f, 0.625f, 1.25f};
    header.set("VoxelSize", 3, size);
    header.bundle("Series 2 Thorax", 1)->set("Slices", 212);
    ZmString text;
    header.print(text);
    std::printf("%s", text.getString());
    ZmDArray<float> spacing;
    const bool haveSpacing = header.findTag("G0028-0030", spacing) != 0 && spacing.size() == 2;
    std::printf("  pixel spacing (0028,0030): %g x %g mm\n", haveSpacing ? double(spacing[0]) : 0.0,
                haveSpacing ? double(spacing[1]) : 0.0);
    std::printf("  private (0029,xx10) of \"ACME Recon 2\": %s\n",
                header.findPrivateTag("ACME Recon 2", "G0029-xx10", "(none)"));
    std::printf("  the series found by its alias \"Thorax\": %s\n",
                header.bundle("thorax") != nullptr ? header.bundle("thorax")->name() : "(none)");
    // The text reads back into a tree that prints the same.
    HxParamBundle back("Back");
    const bool readBack = back.parse(text.getString(), uint64_t(text.length())).ok();
    ZmString again;
    back.print(again);
    const bool same = readBack && again == text;
    std::printf("  printed, read back and printed again: %s\n", same ? "same text" : "DIFFERENT");
    return haveSpacing && same;
}

int zmtool::runDemo(int argc, char** argv)
{
    (void)argv;
    if (argc > 0) {
        std::fprintf(stderr, "usage: zmtool demo\n");
        return 2;
    }
    std::printf("zmlib %s demo\n", ZMLIB_VERSION_STRING);
    // zmtool's log has a folder of its own: clean-up prunes the oldest *.log files of its folder,
    // and those in the shared temporary folder are not all ours.
    ZmLogFile& log = getTheLogInstance();
    log.setBaseFolder(std::string(ZmTmpDir::getSystemTmpPath()) + "zmtool-logs");
    log.setDefaultModule("zmtool");
    const bool logOpen = log.open(false);
    log.tracef(ZmLogInfo, "demo", "zmlib %s demo started", ZMLIB_VERSION_STRING);
    // The stopwatch writes each step's time to the log ("--- demo [n]: ... msec (+ ... ms)").
    ZmWatch watch("demo", true);
    bool (*const steps[])() = {demoStrings,  demoCore,    demoFingerprints,
                               demoGeometry, demoBundles, demoRawData};
    bool ok = true;
    int index = 0;
    for (bool (*step)() : steps) {
        ok = step() && ok;
        watch.dump(++index);
    }
    std::printf("\nsteps timed in the log: %d, %d ms in all\n", index, watch.getTimeMSec());
    printProcessFigures();
    log.tracef(ZmLogInfo, "demo", "demo %s", ok ? "finished" : "FAILED");
    log.flush();
    std::printf("\ndemo %s\n", ok ? "finished" : "FAILED");
    if (logOpen) {
        std::printf("log file: %s\n", log.filePath().getString());
    } else {
        std::printf("log file: none (could not open one in %s); the log went to standard output\n",
                    log.baseFolder().c_str());
    }
    return ok ? 0 : 1;
}
