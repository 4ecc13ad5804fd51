#include "bench/ipc/Codec.h"

#include <plist/plist.h>

namespace {

class Libplist final : public Codec {
public:
    ~Libplist() override { plist_free(m_read); }
    void read(const Payload& payload) override {
        plist_free(m_read);
        plist_from_bin(reinterpret_cast<const char*>(payload.bytes.data()),
                       static_cast<std::uint32_t>(payload.bytes.size()), &m_read);
    }
    void forget() override { plist_free(std::exchange(m_read, nullptr)); }
    std::size_t write(const Payload&) override {
        char* bytes = nullptr;
        std::uint32_t size = 0;
        plist_to_bin(m_read, &bytes, &size);
        plist_to_bin_free(bytes);
        return size;
    }

private:
    plist_t m_read = nullptr;
};

const EnrolledCodec enrolled("libplist",
                             []() -> std::unique_ptr<Codec> { return std::make_unique<Libplist>(); });

} // namespace
