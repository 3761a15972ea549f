#pragma once

#include <cstdint>

namespace Corvo::Plugins {

// The window of a plug-in, inside of one that the host gives by its X11 number. One thread of the host. A
// window whose parent or display has gone does nothing more. Nothing throws.
class Window {
public:
    struct Size {
        int width, height;  // pixels

        bool operator==(const Size&) const = default;
    };
    static constexpr unsigned kIdlePeriod = 33;  // milliseconds

    virtual ~Window() = default;  // closes it

    // How large everything is drawn; otherwise the display says it. Before it is opened the size follows.
    virtual void SetScale(double scale) = 0;
    virtual Size GetSize() const = 0;
    virtual Size Fitting(Size) const = 0;  // the nearest size that it can have
    virtual void Resize(Size) = 0;
    // Shown at once; false when it cannot be.
    virtual bool Open(std::uintptr_t parent) = 0;
    virtual void Close() = 0;
    virtual std::uintptr_t Handle() const = 0;  // its own number; 0 while it is closed
    virtual void Show(bool on) = 0;
    // To be called at every kIdlePeriod: takes what was typed and clicked, and draws what is new.
    virtual void Idle() = 0;
};

}  // namespace Corvo::Plugins
