#pragma once

#include "bench/ipc/Transport.h"

/// One that reads and writes binary property lists.
class Codec {
public:
    virtual ~Codec() = default;
    /// What is read is kept until `forget`.
    virtual void read(const Payload& payload) = 0;
    virtual void forget() = 0;
    /// Of what was read last, or of the payload's value. How many bytes it makes.
    virtual std::size_t write(const Payload& payload) = 0;
};

using MakeCodec = std::unique_ptr<Codec> (*)();
struct NamedCodec {
    const char* name;
    MakeCodec make;
};
std::vector<NamedCodec>& Codecs();
struct EnrolledCodec {
    EnrolledCodec(const char* name, MakeCodec make) { Codecs().push_back({name, make}); }
};
