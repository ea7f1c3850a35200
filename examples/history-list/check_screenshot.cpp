// Checks that a picture has the size it should have and shows something.
// Usage: check-screenshot FILE.png WIDTH HEIGHT
#include <QImage>
#include <QSet>

#include <cstdio>
#include <cstdlib>

namespace {

int countColours(QImage const& picture)
{
    QSet<QRgb> colours;
    for (int y = 0; y < picture.height(); ++y) {
        for (int x = 0; x < picture.width(); ++x) {
            colours.insert(picture.pixel(x, y));
        }
    }
    return colours.size();
}

} // namespace

int main(int argc, char** argv)
{
    if (argc != 4) {
        std::fputs("Usage: check-screenshot FILE.png WIDTH HEIGHT\n", stderr);
        return 2;
    }
    QImage const picture(argv[1]);
    bool const hasSize = picture.width() == std::atoi(argv[2]) && picture.height() == std::atoi(argv[3]);
    int const colours = countColours(picture);
    std::printf("%d x %d, %d colours\n", picture.width(), picture.height(), colours);
    constexpr int kAvatarAndText = 20; // An empty list has a handful: paper, frame, shade.
    return hasSize && colours > kAvatarAndText ? 0 : 1;
}
