#pragma once

#include <gio/gio.h>
#include <memory>
#include <string>

namespace platform {

struct GObjectUnref {
    void operator()(void* object) const { g_object_unref(object); }
};
template <typename Object>
using GObjectPointer = std::unique_ptr<Object, GObjectUnref>;

struct GErrorFree {
    void operator()(GError* error) const { g_error_free(error); }
};
using GErrorPointer = std::unique_ptr<GError, GErrorFree>;

struct GVariantUnref {
    void operator()(GVariant* variant) const { g_variant_unref(variant); }
};

struct GFree {
    void operator()(void* memory) const { g_free(memory); }
};

/// A string that GLib gave us to keep; empty for null.
inline std::string TakeString(char* text) {
    const std::unique_ptr<char, GFree> owner(text);
    return text ? text : "";
}

inline std::string StringOr(const char* text, const char* fallback = "") {
    return text ? text : fallback;
}

} // namespace platform
