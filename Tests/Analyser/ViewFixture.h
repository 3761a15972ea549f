#pragma once

#include <gtest/gtest.h>

#include "Commands.h"
#include "Drawing/Views/ShownAnalyser.h"
#include "Support/DrawingSurface.h"
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
        ASSERT_TRUE(playback);
        playback->playing = !playback->playing;
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
    void Draw(analyser::View& view) {
        m_surface.PaintPlainly([&](cairo_t* context) { view.Draw(context, kWidth, kHeight, 96.0f); });
    }

private:
    static constexpr int kWidth = 960, kHeight = 600;
    TestSupport::DrawingSurface<Corvo::DrawingCairo> m_surface{kWidth, kHeight};
};

}  // namespace AnalyserTest
