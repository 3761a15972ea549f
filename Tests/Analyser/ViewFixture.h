#pragma once

#include <gtest/gtest.h>

#include <cairo.h>

#include "Commands.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "View.h"

namespace AnalyserTest {

struct TestShell : analyser::Shell {
    std::string Source() const override { return "test"; }
    std::vector<std::string> Inputs() const override { return {"first", "second"}; }
    int CurrentInput() const override { return input; }
    void ChooseInput(int index) override { input = index; }
    std::optional<analyser::Playback> GetPlayback() const override { return playback; }
    void Seek(double seconds) override { playback->position = seconds; }
    void TogglePlaying() override {
        if (playback) playback->playing = !playback->playing;
    }
    bool CanFillScreen() const override { return true; }
    void ToggleFullScreen() override { full = !full; }
    bool Copy(const std::string& text) override {
        copied = text;
        return true;
    }
    bool IsToneOn() const override { return tone; }
    void SetTone(bool on) override { tone = on; }

    int input = 0;
    bool full = false, tone = false;
    std::string copied;
    std::optional<analyser::Playback> playback;
};

// Draws on a surface of its own, 960 x 600.
class Canvas {
public:
    static constexpr int kWidth = 960, kHeight = 600;

    Canvas()
        : m_surface(cairo_image_surface_create(CAIRO_FORMAT_RGB24, kWidth, kHeight)),
          m_context(cairo_create(m_surface)) {}
    ~Canvas() {
        cairo_destroy(m_context);
        cairo_surface_destroy(m_surface);
    }
    Canvas(const Canvas&) = delete;
    Canvas& operator=(const Canvas&) = delete;

    void Draw(analyser::View& view) { view.Draw(m_context, kWidth, kHeight, 96.0f); }

private:
    cairo_surface_t* m_surface;
    cairo_t* m_context;
};

}  // namespace AnalyserTest
