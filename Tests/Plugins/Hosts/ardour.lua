-- Makes the session that $SESSION tells: folder, kind (LV2 or VST3), URI or name, channels and preset, separated by
-- bars. Its track holds the plug-in with the preset. Prints the latency.
local folder, kind, id, channels, preset = os.getenv("SESSION"):match("([^|]*)|([^|]*)|([^|]*)|([^|]*)|([^|]*)")
AudioEngine:set_backend("None (Dummy)", "", "")
local session = create_session(folder, "t", 48000)
local track
for route in session:new_audio_track(tonumber(channels), 2, nil, 1, "T",
        ARDOUR.PresentationInfo.max_order, ARDOUR.TrackMode.Normal, true):iter() do
    track = route
end
if kind == "VST3" then
    local name = id
    id = nil
    for plugin in ARDOUR.LuaAPI.list_plugins():iter() do
        if plugin.type == ARDOUR.PluginType.VST3 and plugin.name == name then id = plugin.unique_id end
    end
end
local processor = id and ARDOUR.LuaAPI.new_plugin(session, id, ARDOUR.PluginType[kind], "")
if not processor or processor:isnil() then
    print("FAILED " .. kind .. " " .. (id or "") .. ": Ardour does not know it")
elseif track:add_processor_by_index(processor, 0, nil, true) ~= 0 then
    print("FAILED " .. kind .. " " .. id .. ": Ardour cannot put it into a track")
else
    local plugin = processor:to_insert():plugin(0)
    if preset ~= "" then
        local record = plugin:preset_by_label(preset)
        if not record or not plugin:load_preset(record) then
            print("FAILED " .. kind .. " " .. id .. ": Ardour cannot load the preset " .. preset)
        end
    end
    print("LATENCY " .. processor:to_insert():signal_latency())
end
session:save_state("t", false, false, false, false, false)
close_session()
