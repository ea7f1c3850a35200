// Says what preview picture a drawing has, without reading more than a few hundred bytes of its file.
#include "preview/mu_preview.h"

#include <cstdio>
#include <fstream>

namespace {

class File final : public preview::Source {
public:
    explicit File(char const* path) : file_(path, std::ios::binary | std::ios::ate)
    {
        if (file_) {
            size_ = static_cast<std::uint64_t>(file_.tellg());
        }
    }

    std::uint64_t size() const override { return size_; }
    bool read(std::uint64_t offset, char* bytes, std::size_t count) override
    {
        file_.seekg(static_cast<std::streamoff>(offset));
        return static_cast<bool>(file_.read(bytes, static_cast<std::streamsize>(count)));
    }

private:
    std::ifstream file_;
    std::uint64_t size_ = 0;
};

} // namespace

int main(int argc, char** argv)
{
    if (argc != 2) {
        std::fprintf(stderr, "Usage: preview DRAWING\n");
        return 2;
    }
    File drawing(argv[1]);
    preview::Preview const found = preview::find(drawing);
    switch (found.kind) {
    case preview::Kind::none: std::printf("%s\n", found.reason); return 1;
    case preview::Kind::bitmap: std::printf("A bitmap of %u x %u pixels\n", found.width, found.height); return 0;
    case preview::Kind::png: std::printf("A PNG of %u x %u pixels\n", found.width, found.height); return 0;
    case preview::Kind::metafile: std::printf("A metafile of %u bytes\n", found.length); return 0;
    }
}
