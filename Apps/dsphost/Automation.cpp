#include "Automation.h"

#include <algorithm>
#include <cmath>
#include <set>
#include <utility>
#include <vector>

#include <nlohmann/json.hpp>

#include "Errors.h"
#include "File.h"
#include "Text.h"

namespace dsphost {
namespace {

using Json = nlohmann::json;

constexpr double kLatestSecond = 1e9;
constexpr const char* kLaneForm =
    R"(a lane is {"effect": "NAME", "parameter": "LABEL", "points": [[seconds, value], ...]})";

constexpr std::size_t kLargestFile = std::size_t{16} << 20;  // about a million points
constexpr int kDeepest = 8;                                  // of nested brackets
constexpr std::size_t kLongestList = 8;                      // that a message repeats

// What stands in a file, cut to a length that a message can have.
std::string Quoted(const Json& json) {
    if (json.is_structured() && json.size() > kLongestList)
        return (json.is_array() ? "a list of " : "an object of ") + std::to_string(json.size());
    return Shortened(json.dump(-1, ' ', false, Json::error_handler_t::replace), kLongestQuote);
}

std::size_t FindElement(const Json& lane, Chain& chain) {
    std::vector<std::string> names;
    for (std::size_t i = 0; i < chain.Size(); ++i) names.push_back(chain.Element(i).Name());
    if (!lane.contains("effect")) {
        if (names.size() == 1) return 0;
        throw UserError("\"effect\" is missing; the chain has " + Joined(names, ", "));
    }
    const Json& effect = lane["effect"];
    if (effect.is_number_integer()) {
        const auto place = effect.get<double>();  // of any size
        if (place >= 1.0 && place <= static_cast<double>(names.size()))
            return static_cast<std::size_t>(place) - 1;
        throw UserError("the chain has no effect " + Quoted(effect) + "; places go from 1 to " +
                        std::to_string(names.size()));
    }
    if (!effect.is_string()) throw UserError("\"effect\" is a name or a place in the chain");
    const std::size_t found = FindName(effect.get<std::string>(), names, "effect in the chain");
    if (std::ranges::count(names, names[found]) > 1)
        throw UserError(names[found] + " stands in the chain more than once; give its place, from 1");
    return found;
}

AutomationPoint ReadPoint(const Json& point, int rate) {
    const bool pair = point.is_array() && point.size() == 2;
    if (!pair && !(point.is_object() && point.contains("time") && point.contains("value")))
        throw UserError("a point is [seconds, value] or {\"time\": seconds, \"value\": value}, not " +
                        Quoted(point));
    const Json& time = pair ? point[0] : point["time"];
    const Json& value = pair ? point[1] : point["value"];
    if (!time.is_number() || !(time.get<double>() >= 0.0) || time.get<double>() > kLatestSecond)
        throw UserError("a point's time is a number of seconds from 0 on, not " + Quoted(time));
    if (!value.is_number() || !(value.get<double>() >= 0.0 && value.get<double>() <= 1.0))
        throw UserError("a point's value is a normalised value from 0 to 1, not " + Quoted(value));
    return {std::llround(time.get<double>() * rate), value.get<float>()};
}

std::vector<AutomationPoint> ReadPoints(const Json& lane, int rate) {
    std::vector<AutomationPoint> points;
    for (const auto& point : lane["points"]) points.push_back(ReadPoint(point, rate));
    std::ranges::stable_sort(points, {}, &AutomationPoint::frame);
    return points;
}

}  // namespace

void LoadAutomation(const std::string& path, int rate, Chain& chain) {
    ReadAutomation(ReadWhole(path, kLargestFile), path, rate, chain);
}

void ReadAutomation(std::string_view text, const std::string& path, int rate, Chain& chain) {
    Json file;
    try {
        file = Json::parse(text, [&](int depth, Json::parse_event_t, Json&) {
            if (depth > kDeepest) throw UserError(path + ": is nested too deeply; " + kLaneForm);
            return true;
        });
    } catch (const Json::parse_error& error) {
        throw UserError(path + ": is not JSON: error at byte " + std::to_string(error.byte));
    } catch (const Json::exception&) {
        throw UserError(path + ": is not JSON that can be used: it holds a number that is too large");
    }
    if (file.is_object()) file = Json::array({file});
    if (!file.is_array()) throw UserError(path + ": is not a list of lanes; " + kLaneForm);
    std::set<std::pair<std::size_t, int>> taken;
    for (std::size_t i = 0; i < file.size(); ++i) {
        const Json& lane = file[i];
        const std::string where = path + ": lane " + std::to_string(i + 1) + ": ";
        try {
            if (!lane.is_object() || !lane.contains("parameter") || !lane["parameter"].is_string() ||
                !lane.contains("points") || !lane["points"].is_array() || lane["points"].empty())
                throw UserError(kLaneForm);
            const std::size_t element = FindElement(lane, chain);
            const auto points = ReadPoints(lane, rate);
            for (const int index :
                 chain.Element(element).AutomationLanes(lane["parameter"].get<std::string>())) {
                if (!taken.emplace(element, index).second)
                    throw UserError("the same parameter has a lane already");
                chain.Automate(element, index, points);
            }
        } catch (const UserError& error) {
            throw UserError(where + error.what());
        }
    }
}

}  // namespace dsphost
