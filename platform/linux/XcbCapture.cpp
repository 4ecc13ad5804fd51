#include "platform/linux/XcbCapture.h"

#include "platform/linux/Descriptor.h"
#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <sys/mman.h>
#include <unistd.h>
#include <xcb/shm.h>
#include <xcb/xcb.h>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr std::size_t bytesPerPixel = 4;

/// Memory that the server maps too.
class SharedPixels {
public:
    explicit SharedPixels(std::size_t size)
        : m_descriptor(::memfd_create("screen", MFD_CLOEXEC))
        , m_size(size) {
        if (!m_descriptor || ::ftruncate(m_descriptor.get(), static_cast<off_t>(size)) != 0) return;
        void* mapped = ::mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_SHARED, m_descriptor.get(), 0);
        if (mapped != MAP_FAILED) m_data = static_cast<unsigned char*>(mapped);
    }
    ~SharedPixels() {
        if (m_data) ::munmap(m_data, m_size);
    }
    SharedPixels(const SharedPixels&) = delete;
    SharedPixels& operator=(const SharedPixels&) = delete;

    unsigned char* data() const { return m_data; }
    /// The connection closes it.
    int releaseDescriptor() {
        const int number = ::dup(m_descriptor.get());
        m_descriptor.reset();
        return number;
    }

private:
    Descriptor m_descriptor;
    std::size_t m_size;
    unsigned char* m_data = nullptr;
};

bool storesPixelsAsWeDo(const xcb_setup_t* setup, std::uint8_t depth) {
    if (setup->image_byte_order != XCB_IMAGE_ORDER_LSB_FIRST) return false;
    for (auto i = xcb_setup_pixmap_formats_iterator(setup); i.rem; xcb_format_next(&i))
        if (i.data->depth == depth) return depth >= 24 && i.data->bits_per_pixel == 8 * bytesPerPixel;
    return false;
}

} // namespace

QImage XcbCapture(const QRect& area) {
    auto* c = XcbConnection();
    if (!c || area.isEmpty()) return {};
    const auto* extension = xcb_get_extension_data(c, &xcb_shm_id);
    const xcb_screen_t* screen = xcb_setup_roots_iterator(xcb_get_setup(c)).data;
    if (!extension || !extension->present || !storesPixelsAsWeDo(xcb_get_setup(c), screen->root_depth))
        return {};
    const auto stride = static_cast<std::size_t>(area.width()) * bytesPerPixel;
    auto pixels = std::make_unique<SharedPixels>(stride * static_cast<std::size_t>(area.height()));
    if (!pixels->data()) return {};

    const xcb_shm_seg_t segment = xcb_generate_id(c);
    const auto attached = xcb_shm_attach_fd_checked(c, segment, pixels->releaseDescriptor(), 0);
    const auto cookie = xcb_shm_get_image(
        c, screen->root, static_cast<std::int16_t>(area.x()), static_cast<std::int16_t>(area.y()),
        static_cast<std::uint16_t>(area.width()), static_cast<std::uint16_t>(area.height()), ~0U,
        XCB_IMAGE_FORMAT_Z_PIXMAP, segment, 0);
    xcb_generic_error_t* error = nullptr; // asked for, or the toolkit would log it
    const XcbReply<xcb_shm_get_image_reply_t> reply(xcb_shm_get_image_reply(c, cookie, &error));
    const XcbReply<xcb_generic_error_t> notCaptured(error);
    const XcbReply<xcb_generic_error_t> notAttached(xcb_request_check(c, attached));
    if (!notAttached) xcb_shm_detach(c, segment);
    if (!reply) return {};
    const auto free = [](void* held) { delete static_cast<SharedPixels*>(held); };
    auto* data = pixels->data();
    return {data, area.width(),    area.height(), static_cast<qsizetype>(stride), QImage::Format_RGB32,
            free, pixels.release()};
}

} // namespace platform
