// Makes the project that the demo shows: drawings, notes, prints, and what drawing editors leave behind.
// The same bytes every time.
//
//     make_sample FOLDER            the project; the folder must not exist yet
//     make_sample --plan N FILE     version N of a drawing whose preview picture shows a floor plan

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <utility>

namespace {

namespace fs = std::filesystem;

constexpr std::size_t kKiB = 1024;

/// Bytes as little compressible as those of a drawing (Marsaglia's xorshift, 64 bits).
class Noise {
public:
    explicit Noise(std::uint64_t seed) : state_(seed * 0x9E3779B97F4A7C15U + 1) {}

    std::uint64_t next()
    {
        state_ ^= state_ << 13;
        state_ ^= state_ >> 7;
        state_ ^= state_ << 17;
        return state_;
    }

    std::size_t between(std::size_t low, std::size_t high) { return low + next() % (high - low + 1); }

private:
    std::uint64_t state_;
};

class Sample {
public:
    explicit Sample(fs::path folder) : folder_(std::move(folder)) { fs::create_directories(folder_); }

    void write(std::string const& name, std::string_view start, std::size_t size)
    {
        fs::path const path = folder_ / name;
        fs::create_directories(path.parent_path());
        std::ofstream file(path, std::ios::binary);
        file.exceptions(std::ios::badbit | std::ios::failbit);
        file.write(start.data(), static_cast<std::streamsize>(start.size()));
        writeNoise(file, size - std::min(size, start.size()));
        file.close();
        ++count_;
        total_ += std::max(size, start.size());
    }

    std::size_t between(std::size_t low, std::size_t high) { return noise_.between(low, high); }

    void drawing(std::string const& name)
    {
        // As in real projects: mostly details of some hundred kilobytes, some plans, few models.
        std::size_t const kind = between(0, 9);
        std::size_t const size = kind < 4   ? between(100, 900)
                                 : kind < 8 ? between(1'000, 6'000)
                                            : between(12'000, 20'000);
        write(name, "AC1032", size * kKiB);
    }

    void report() const { std::printf("%zu files, %.0f MB\n", count_, static_cast<double>(total_) / 1e6); }

private:
    void writeNoise(std::ofstream& file, std::size_t size)
    {
        std::array<std::uint64_t, 8 * kKiB> block{};
        while (size > 0) {
            std::generate(block.begin(), block.end(), [this] { return noise_.next(); });
            std::size_t const part = std::min(size, sizeof block);
            file.write(reinterpret_cast<char const*>(block.data()), static_cast<std::streamsize>(part));
            size -= part;
        }
    }

    fs::path folder_;
    Noise noise_{1};
    std::size_t count_ = 0;
    std::size_t total_ = 0;
};

std::string numbered(std::string_view prefix, int number, std::string_view suffix)
{
    std::string digits = std::to_string(number);
    digits.insert(0, 2 - std::min<std::size_t>(2, digits.size()), '0');
    return std::string(prefix) + digits + std::string(suffix);
}

void makeDrawings(Sample& sample)
{
    constexpr std::string_view kTrades[] = {
        "architecture/A-", "structure/S-", "services/heating/H-", "services/electrical/E-"};
    for (std::string_view const trade : kTrades) {
        for (int number = 1; number <= 12; ++number) {
            sample.drawing(numbered(trade, number, ".dwg"));
        }
    }
    // Two names that look alike: a letter with its accent in one character, and in two.
    for (char const* const name :
         {"site plan.dwg", "details/caf\u00e9.dwg", "details/cafe\u0301.dwg", "details/Fa\u00e7ade \u00d6st.dwg",
          "partners/\u039a\u03ac\u03c4\u03bf\u03c8\u03b7.dwg",
          "partners/\u041f\u043b\u0430\u043d \u044d\u0442\u0430\u0436\u0430.dwg", "partners/\u5e73\u9762\u56fe.dwg",
          "partners/\u0645\u062e\u0637\u0637.dwg", "partners/\U0001F3E0 house.dwg",
          "details/door's \"left\" & right.dwg", "details/100%.dwg", "details/UPPER.DWG"}) {
        sample.drawing(name);
    }
}

void makeDocuments(Sample& sample)
{
    constexpr std::string_view kPdf = "%PDF-1.4\n%\xE2\xE3\xCF\xD3\n";
    sample.write("notes.txt", "Site meeting on Monday.\n- The north facade moves by 20 cm.\n", 0);
    sample.write("partners/\u5099\u8003.txt", "\u5e73\u9762\u56fe: 1:100\n", 0);
    sample.write("empty.txt", "", 0);
    for (int number = 1; number <= 6; ++number) {
        sample.write(numbered("prints/sheet ", number, ".pdf"), kPdf, sample.between(40, 300) * kKiB);
    }
}

/// What tav leaves out: backups, and the locks of drawings that somebody has open.
void makeLeftovers(Sample& sample)
{
    for (int number = 1; number <= 6; ++number) {
        sample.write(numbered("architecture/A-", number, ".bak"), "AC1032", 200 * kKiB);
    }
    for (char const* const name : {"architecture/A-01", "structure/S-03", "site plan"}) {
        sample.write(std::string(name) + ".dwl", "anna\nDESK-7\n", 0);
        sample.write(std::string(name) + ".dwl2", "<whoami><username>anna</username></whoami>\n", 0);
    }
}

void appendNumber(std::string& bytes, std::uint32_t value)
{
    for (unsigned shift = 0; shift < 32; shift += 8) {
        bytes += static_cast<char>(value >> shift & 0xFFU);
    }
}

constexpr std::uint32_t kPlanWidth = 180;
constexpr std::uint32_t kPlanHeight = 120;

/// Three rooms. With each version the wall between two of them moves, and from the second on there is a door.
bool isWall(std::uint32_t x, std::uint32_t y, std::uint32_t version)
{
    std::uint32_t const wall = 70 + 10 * version;
    bool const isInside = x >= 10 && x < kPlanWidth - 10 && y >= 10 && y < kPlanHeight - 10;
    bool const isOuter = x < 13 || x >= kPlanWidth - 13 || y < 13 || y >= kPlanHeight - 13;
    bool const isInner = (x >= wall && x < wall + 3) || (x > wall && y >= 60 && y < 63);
    bool const isDoor = version > 1 && x >= wall && x < wall + 3 && y >= 80 && y < 95;
    return isInside && (isOuter || (isInner && !isDoor));
}

/// A bitmap of 8 bits for each pixel without file header, as editors keep it in drawings.
std::string planPicture(std::uint32_t version)
{
    std::string bitmap;
    for (std::uint32_t const field :
         {std::uint32_t{40}, kPlanWidth, kPlanHeight, 0x00080001U, 0U, 0U, 0U, 0U, 2U, 0U}) {
        appendNumber(bitmap, field);
    }
    bitmap.append({'\xFF', '\xFF', '\xFF', 0, '\x30', '\x20', '\x20', 0}); // the two colors
    for (std::uint32_t y = 0; y < kPlanHeight; ++y) {
        for (std::uint32_t x = 0; x < kPlanWidth; ++x) {
            bitmap += static_cast<char>(isWall(x, y, version));
        }
    }
    return bitmap;
}

/// The beginning of a drawing, up to the end of its preview picture.
std::string planDrawing(std::uint32_t version)
{
    constexpr std::string_view kMark = "\x1F\x25\x6D\x07\xD4\x36\x28\x28\x9D\x57\xCA\x3F\x9D\x44\x10\x2B";
    constexpr std::uint32_t kPreviewAt = 64;
    constexpr std::uint32_t kPictureAt = kPreviewAt + 16 + 4 + 1 + 9;
    std::string const picture = planPicture(version);
    auto const length = static_cast<std::uint32_t>(picture.size());
    std::string drawing = "AC1015";
    drawing.resize(13);
    appendNumber(drawing, kPreviewAt);
    drawing.resize(kPreviewAt);
    drawing += kMark;
    appendNumber(drawing, 1 + 9 + length);
    drawing.append({1, 2}); // one entry, a bitmap
    appendNumber(drawing, kPictureAt);
    appendNumber(drawing, length);
    return drawing + picture;
}

void makePlan(std::string const& version, fs::path const& path)
{
    Sample sample(path.parent_path().empty() ? "." : path.parent_path());
    sample.write(path.filename(), planDrawing(static_cast<std::uint32_t>(std::stoul(version))), 300 * kKiB);
}

} // namespace

int main(int argc, char** argv)
try {
    if (argc == 4 && std::string_view(argv[1]) == "--plan") {
        makePlan(argv[2], argv[3]);
        return 0;
    }
    if (argc != 2 || fs::exists(argv[1])) {
        std::fprintf(stderr, "usage: make_sample FOLDER, which must not exist yet, or make_sample --plan N FILE\n");
        return 2;
    }
    Sample sample(argv[1]);
    makeDrawings(sample);
    makeDocuments(sample);
    makeLeftovers(sample);
    sample.report();
    return 0;
} catch (std::exception const& error) {
    std::fprintf(stderr, "make_sample: %s\n", error.what());
    return 1;
}
