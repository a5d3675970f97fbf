// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_GLIBPOINTERS_H
#define CORVANE_SIMULATOR_GLIBPOINTERS_H

#include <gio/gio.h>

#include <memory>
#include <utility>

namespace Corvane
{
namespace Simulator
{

/** Calls a GLib free function from a std::unique_ptr. */
template <auto Free> struct GlibDeleter {
    template <typename T> void operator()(T *pointer) const { Free(pointer); }
};

using GCharPointer = std::unique_ptr<gchar, GlibDeleter<g_free>>;
using GNodeInfoPointer = std::unique_ptr<GDBusNodeInfo, GlibDeleter<g_dbus_node_info_unref>>;
using GMainLoopPointer = std::unique_ptr<GMainLoop, GlibDeleter<g_main_loop_unref>>;
template <typename T> using GObjectPointer = std::unique_ptr<T, GlibDeleter<g_object_unref>>;

/** A reference to a GVariant; never a floating one. */
class Variant
{
public:
    Variant() = default;
    /** Takes what a g_variant_new or g_variant_get function returned, floating or not. */
    explicit Variant(GVariant *returned)
        : m_value(returned ? g_variant_take_ref(returned) : nullptr)
    {
    }
    Variant(const Variant &other)
        : m_value(other.m_value ? g_variant_ref(other.m_value) : nullptr)
    {
    }
    Variant(Variant &&other) noexcept
        : m_value(std::exchange(other.m_value, nullptr))
    {
    }
    ~Variant()
    {
        if (m_value)
            g_variant_unref(m_value);
    }
    Variant &operator=(Variant other) noexcept
    {
        std::swap(m_value, other.m_value);
        return *this;
    }
    /** A new reference to a value that somebody else owns. */
    static Variant shared(GVariant *value) { return value ? Variant(g_variant_ref(value)) : Variant(); }

    GVariant *get() const { return m_value; }
    explicit operator bool() const { return m_value; }

private:
    GVariant *m_value = nullptr;
};

/** Receives the GError of a call: pass it by address, then ask. */
class ErrorSlot
{
public:
    ErrorSlot() = default;
    ~ErrorSlot() { g_clear_error(&m_error); }
    ErrorSlot(const ErrorSlot &) = delete;
    ErrorSlot &operator=(const ErrorSlot &) = delete;

    GError **operator&() { return &m_error; }
    explicit operator bool() const { return m_error; }
    const GError *operator->() const { return m_error; }
    GError *get() const { return m_error; }

private:
    GError *m_error = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_GLIBPOINTERS_H
