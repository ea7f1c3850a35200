// Makes the files of the storage rows: a version of a drawing in one of the forms in which offices keep drawings.
// The same bytes every time.
//
//     make_versions FORM SEED VERSION ENTITIES [SHEET]
//
// FORM: dwg    binary records with offsets to all of them at the end, as in drawings that are not packed
//       packed the same in packed pages
//       dxf    text
//       pdf    a deflated stream for each sheet, a font, offsets at the end
//       docx   a zip archive of deflated parts
// Each VERSION has the edits of those before it, and some more. Each SHEET of a SEED begins with the same drawing, and
// replaces a fifth of it.

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>
#include <zlib.h>

namespace {

/// Marsaglia's xorshift, 64 bits.
class Noise {
public:
    explicit Noise(std::uint64_t seed) : state_(seed * 0x9E3779B97F4A7C15U + 1) { next(), next(); }

    std::uint64_t next()
    {
        state_ ^= state_ << 13;
        state_ ^= state_ >> 7;
        state_ ^= state_ << 17;
        return state_;
    }
    std::uint64_t below(std::uint64_t limit) { return (next() >> 11) % limit; }

private:
    std::uint64_t state_;
};

struct Entity {
    unsigned handle;
    unsigned type;
    unsigned layer;
    double x, y, length;
};

struct Drawing {
    std::vector<Entity> entities;
    unsigned nextHandle = 0x100;
    unsigned version = 1;
    std::uint64_t seed = 0;
};

/// Walls and hatches repeat a few lengths on a grid of millimetres; some points are computed and have all their bits.
Entity entity(Noise& noise, unsigned handle)
{
    double const x = static_cast<double>(noise.below(84100));
    double const y = static_cast<double>(noise.below(59400));
    double const fraction = noise.below(4) == 0 ? static_cast<double>(noise.next() >> 11) * 0x1p-53 : 0;
    return {
        handle,       static_cast<unsigned>(noise.below(7)),     static_cast<unsigned>(noise.below(24)), x + fraction,
        y + fraction, static_cast<double>(125 * noise.below(40))};
}

/// Work of an hour: some entities next to each other are moved, some are erased, some are new.
void edit(Drawing& drawing, Noise& noise, std::size_t count)
{
    std::vector<Entity>& entities = drawing.entities;
    std::size_t const place = noise.below(entities.size() - 2 * count);
    for (std::size_t i = 0; i < count; ++i) {
        entities[place + i].x += 250;
    }
    auto const erased = entities.begin() + static_cast<std::ptrdiff_t>(place + count);
    entities.erase(erased, erased + static_cast<std::ptrdiff_t>(count / 4));
    for (std::size_t i = 0; i < count / 2; ++i) {
        entities.push_back(entity(noise, drawing.nextHandle++));
    }
}

Drawing drawing(std::uint64_t seed, unsigned version, std::size_t count, unsigned sheet)
{
    Drawing drawing;
    drawing.seed = seed * 1000 + sheet;
    drawing.version = version;
    Noise noise(seed);
    for (std::size_t i = 0; i < count; ++i) {
        drawing.entities.push_back(entity(noise, drawing.nextHandle++));
    }
    Noise others(drawing.seed);
    for (unsigned part = 0; sheet > 0 && part < 10; ++part) { // In ten places, as sheets of one building differ.
        std::size_t const first = others.below(count - count / 50);
        for (std::size_t i = 0; i < count / 50; ++i) {
            drawing.entities[first + i] = entity(others, drawing.entities[first + i].handle);
        }
    }
    for (unsigned v = 2; v <= version; ++v) {
        edit(drawing, others, 8 + others.below(24));
    }
    return drawing;
}

template <class T>
void append(std::string& bytes, T value)
{
    bytes.append(reinterpret_cast<char const*>(&value), sizeof value);
}

std::string recordOf(Entity const& entity)
{
    std::string record;
    append(record, static_cast<std::uint8_t>(17 + entity.type));
    append(record, entity.handle);
    append(record, static_cast<std::uint8_t>(entity.layer));
    append(record, entity.x);
    append(record, entity.y);
    append(record, entity.x + entity.length);
    append(record, entity.y);
    record += "\x5a\x82\x01\x90"; // colour, line type
    append(
        record, static_cast<std::uint16_t>(
                    crc32(0, reinterpret_cast<Bytef const*>(record.data()), static_cast<uInt>(record.size()))));
    return record;
}

/// What every save writes anew: the time, a number, counts.
std::string saveMark(Drawing const& drawing)
{
    Noise noise(drawing.seed * 131 + drawing.version);
    std::string mark;
    append(mark, noise.next());
    append(mark, noise.next());
    append(mark, drawing.version);
    append(mark, drawing.nextHandle);
    return mark;
}

std::string tables()
{
    std::string text;
    for (int i = 0; i < 300; ++i) {
        text += "LAYER A-WALL-" + std::to_string(i * 37 % 100) + " CONTINUOUS " + std::to_string(i) + '\n';
    }
    return text;
}

std::string binary(Drawing const& drawing)
{
    std::string bytes = "AC1015" + std::string(7, '\0') + saveMark(drawing) + tables();
    std::string map;
    for (Entity const& entity : drawing.entities) {
        append(map, entity.handle);
        append(map, static_cast<std::uint32_t>(bytes.size()));
        bytes += recordOf(entity);
    }
    return bytes + map + saveMark(drawing);
}

/// Literals and matches in whole bytes, as simple packers write them.
std::string packed(std::string_view page)
{
    std::string bytes;
    std::unordered_map<std::uint32_t, std::size_t> seen;
    std::size_t literals = 0;
    auto const flush = [&](std::size_t end) {
        while (literals < end) {
            std::size_t const run = std::min<std::size_t>(end - literals, 127);
            bytes += static_cast<char>(run);
            bytes += page.substr(literals, run);
            literals += run;
        }
    };
    std::size_t i = 0;
    while (i + 4 <= page.size()) {
        std::uint32_t key;
        std::memcpy(&key, page.data() + i, 4);
        auto const [found, isNew] = seen.emplace(key, i);
        std::size_t const from = std::exchange(found->second, i);
        std::size_t length = 0;
        while (!isNew && i + length < page.size() && length < 127 && page[from + length] == page[i + length]) {
            ++length;
        }
        if (length < 4) {
            ++i;
            continue;
        }
        flush(i);
        bytes += static_cast<char>(128 + length);
        append(bytes, static_cast<std::uint16_t>(i - from));
        literals = i += length;
    }
    flush(page.size());
    return bytes;
}

std::string pages(Drawing const& drawing)
{
    constexpr std::size_t kPage = 0x7400;
    std::string const plain = binary(drawing);
    std::string bytes = "AC1024" + saveMark(drawing);
    std::string map;
    for (std::size_t offset = 0; offset < plain.size(); offset += kPage) {
        std::string const page = packed(std::string_view(plain).substr(offset, kPage));
        append(map, static_cast<std::uint32_t>(bytes.size()));
        append(
            bytes, static_cast<std::uint32_t>(
                       crc32(0, reinterpret_cast<Bytef const*>(page.data()), static_cast<uInt>(page.size()))));
        append(bytes, static_cast<std::uint32_t>(page.size()));
        bytes += page;
        bytes.resize((bytes.size() + 31) / 32 * 32);
    }
    return bytes + map;
}

std::string number(double value)
{
    char text[40];
    std::snprintf(text, sizeof text, "%.12g", value);
    return text;
}

std::string dxf(Drawing const& drawing)
{
    std::string text = "  0\nSECTION\n  2\nHEADER\n  9\n$TDUPDATE\n 40\n2460000." +
                       std::to_string(drawing.version * 7919) + "\n  0\nENDSEC\n  0\nSECTION\n  2\nENTITIES\n";
    for (Entity const& entity : drawing.entities) {
        char handle[16];
        std::snprintf(handle, sizeof handle, "%X", entity.handle);
        text += std::string("  0\nLINE\n  5\n") + handle + "\n100\nAcDbEntity\n  8\nA-WALL-" +
                std::to_string(entity.layer) + "\n100\nAcDbLine\n 10\n" + number(entity.x) + "\n 20\n" +
                number(entity.y) + "\n 30\n0.0\n 11\n" + number(entity.x + entity.length) + "\n 21\n" +
                number(entity.y) + "\n 31\n0.0\n";
    }
    return text + "  0\nENDSEC\n  0\nEOF\n";
}

std::string deflated(std::string const& bytes, bool isRaw)
{
    z_stream stream{};
    if (deflateInit2(&stream, 6, Z_DEFLATED, isRaw ? -15 : 15, 8, Z_DEFAULT_STRATEGY) != Z_OK) {
        std::abort();
    }
    std::string out(deflateBound(&stream, bytes.size()), '\0');
    stream.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(bytes.data()));
    stream.avail_in = static_cast<uInt>(bytes.size());
    stream.next_out = reinterpret_cast<Bytef*>(out.data());
    stream.avail_out = static_cast<uInt>(out.size());
    deflate(&stream, Z_FINISH);
    out.resize(stream.total_out);
    deflateEnd(&stream);
    return out;
}

std::string noiseBytes(std::uint64_t seed, std::size_t count)
{
    Noise noise(seed);
    std::string bytes;
    while (bytes.size() < count) {
        append(bytes, noise.next());
    }
    return bytes;
}

std::string pdf(Drawing const& drawing)
{
    std::vector<std::string> objects = {
        "<</Type/Catalog/Pages 2 0 R>>", "<</Type/Pages/Count 12>>",
        "<</Length 60000>>stream\n" + noiseBytes(drawing.seed, 60000) + "\nendstream"};
    std::size_t const page = drawing.entities.size() / 12 + 1;
    for (std::size_t first = 0; first < drawing.entities.size(); first += page) {
        std::string content;
        for (std::size_t i = first; i < std::min(first + page, drawing.entities.size()); ++i) {
            Entity const& entity = drawing.entities[i];
            content += number(entity.x) + ' ' + number(entity.y) + " m " + number(entity.x + entity.length) + ' ' +
                       number(entity.y) + " l S\n";
        }
        std::string const stream = deflated(content, false);
        objects.push_back(
            "<</Filter/FlateDecode/Length " + std::to_string(stream.size()) + ">>stream\n" + stream + "\nendstream");
    }
    std::string bytes = "%PDF-1.6\n";
    std::string table;
    for (std::size_t i = 0; i < objects.size(); ++i) {
        char row[32];
        std::snprintf(row, sizeof row, "%010zu 00000 n \n", bytes.size());
        table += row;
        bytes += std::to_string(i + 1) + " 0 obj\n" + objects[i] + "\nendobj\n";
    }
    return bytes + "xref\n" + table + "trailer<</ID<" + std::to_string(drawing.version * 7919) + ">>>\n%%EOF\n";
}

struct Part {
    std::string name, content;
    bool isStored;
};

std::string zip(std::vector<Part> const& parts, unsigned time)
{
    std::string bytes;
    std::string directory;
    for (Part const& part : parts) {
        std::string const kept = part.isStored ? part.content : deflated(part.content, true);
        std::string head;
        append(head, std::uint32_t{0x00080014});
        append(head, static_cast<std::uint16_t>(part.isStored ? 0 : 8));
        append(head, time);
        append(
            head, static_cast<std::uint32_t>(crc32(
                      0, reinterpret_cast<Bytef const*>(part.content.data()), static_cast<uInt>(part.content.size()))));
        append(head, static_cast<std::uint32_t>(kept.size()));
        append(head, static_cast<std::uint32_t>(part.content.size()));
        append(head, static_cast<std::uint32_t>(part.name.size()));
        directory += "PK\1\2" + head + std::string(12, '\0');
        append(directory, static_cast<std::uint32_t>(bytes.size()));
        directory += part.name;
        bytes += "PK\3\4" + head + part.name + kept;
    }
    std::size_t const start = bytes.size();
    bytes += directory + "PK\5\6";
    append(bytes, static_cast<std::uint32_t>(start));
    return bytes;
}

std::string docx(Drawing const& drawing)
{
    std::string document = "<w:document>";
    for (Entity const& entity : drawing.entities) {
        document += "<w:p w:rsidR=\"00" + std::to_string(entity.layer) + "\"><w:r><w:t>Item " +
                    std::to_string(entity.handle) + ": wall of " + number(entity.length) + " at " + number(entity.x) +
                    "</w:t></w:r></w:p>";
    }
    std::string core = "<cp:revision>" + std::to_string(drawing.version) + "</cp:revision>";
    return zip(
        {{"[Content_Types].xml", tables(), false},
         {"word/document.xml", document, false},
         {"word/media/image1.png", noiseBytes(drawing.seed, 90000), true},
         {"word/styles.xml", tables() + tables(), false},
         {"docProps/core.xml", core, false}},
        0x5a210000); // Word processors write the same time for all parts.
}

} // namespace

int main(int argc, char** argv)
{
    if (argc < 5) {
        return 2;
    }
    std::string_view const form = argv[1];
    Drawing const made = drawing(
        std::strtoull(argv[2], nullptr, 10), static_cast<unsigned>(std::atoi(argv[3])),
        std::strtoull(argv[4], nullptr, 10), argc > 5 ? static_cast<unsigned>(std::atoi(argv[5])) : 0);
    std::string const bytes = form == "dwg"      ? binary(made)
                              : form == "packed" ? pages(made)
                              : form == "dxf"    ? dxf(made)
                              : form == "pdf"    ? pdf(made)
                                                 : docx(made);
    return std::fwrite(bytes.data(), 1, bytes.size(), stdout) == bytes.size() ? 0 : 1;
}
