#pragma once

#include <atomic>
#include <cstdint>

#include "Platform/Export.h"

// What analysers tell the host. The first argument of every message is the address of the analyser; the
// second is 0 unless said.
enum SpectrumMessage : int {
    kMessageFrameReady,        // a frame was prepared and can be drawn
    kMessageSettingsChanged,   // a menu command was carried out; the second argument is its number
    kMessageNoteChanged,       // the tuner's note changed; the second argument is 1 when there is one
    kMessageTunerPanelRedraw,  // the tuner panel wants redrawing
};

// The host's way of being told. Called without any lock held, on the thread that caused the message; never
// on the audio thread.
class DSP_API MessagePoster {
public:
    virtual ~MessagePoster();
    // Returns at once; the message is handled later.
    virtual void Post(int message, std::intptr_t first, std::intptr_t second) = 0;
    // Returns when the message has been handled.
    virtual void Send(int message, std::intptr_t first, std::intptr_t second) = 0;
};

// What all analysers share besides their settings.
class DSP_API SpectrumStaticInfo {
public:
    // The poster stays the host's and must outlive its being set; null for none.
    void SetMessagePoster(MessagePoster* poster);
    MessagePoster* GetMessagePoster() const;

private:
    std::atomic<MessagePoster*> m_poster{nullptr};
};
