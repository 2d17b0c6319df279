// The picture library's simple interface, into memory.
#include "report/png_image.h"

#include <png.h>

#include <stdexcept>
#include <string>

namespace tessaly {

static_assert(sizeof(Rgb) == 3, "the encoder reads the colours as bytes");

std::vector<unsigned char> encodePng(const IndexedImage& image, const ColourScale& colours) {
    png_image head{};
    head.version = PNG_IMAGE_VERSION;
    head.width = static_cast<png_uint_32>(image.width);
    head.height = static_cast<png_uint_32>(image.height);
    head.format = PNG_FORMAT_RGB_COLORMAP;
    head.colormap_entries = static_cast<png_uint_32>(colours.size());
    std::vector<unsigned char> bytes(PNG_IMAGE_PNG_SIZE_MAX(head));
    png_alloc_size_t size = bytes.size();
    if (png_image_write_to_memory(&head, bytes.data(), &size, 0, image.pixels.data(), image.width,
                                  colours.data()) == 0) {
        throw std::runtime_error(std::string("cannot draw into the page: ") + head.message);
    }
    bytes.resize(size);
    return bytes;
}

}  // namespace tessaly
