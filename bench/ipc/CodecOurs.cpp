#include "bench/ipc/Codec.h"

#include "lib/plist/Binary.h"

namespace {

class OurCodec final : public Codec {
public:
    void read(const Payload& payload) override {
        // Nobody else owns the bytes, as none does of a mapping.
        m_read = plist::ParseBinary(plist::Data(payload.bytes, nullptr), m_error);
    }
    void forget() override { m_read = {}; }
    std::size_t write(const Payload&) override { return plist::WriteBinary(m_read, m_error).size; }

private:
    plist::Value m_read;
    std::string m_error;
};

/// Of a value that code has built, as a server does, not of one that was parsed.
class BuiltByCode final : public Codec {
public:
    void read(const Payload&) override {}
    void forget() override {}
    std::size_t write(const Payload& payload) override {
        std::string error;
        return plist::WriteBinary(plist::Dictionary{{"message", payload.userInfo}}, error).size;
    }
};

const EnrolledCodec enrolled("ours", []() -> std::unique_ptr<Codec> { return std::make_unique<OurCodec>(); });
const EnrolledCodec built("ours, built",
                          []() -> std::unique_ptr<Codec> { return std::make_unique<BuiltByCode>(); });

} // namespace
