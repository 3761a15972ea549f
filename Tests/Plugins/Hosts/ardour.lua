-- Makes the session that $SESSION tells: folder, kind (LV2 or VST3), URI or name, channels, preset and values of
-- controls ("NAME=NUMBER NAME=NUMBER"), separated by bars. Its track holds the plug-in. Prints the latency.
local folder, kind, id, channels, preset, values =
    os.getenv("SESSION"):match("([^|]*)|([^|]*)|([^|]*)|([^|]*)|([^|]*)|([^|]*)")
AudioEngine:set_backend("None (Dummy)", "", "")
local session = create_session(folder, "t", 48000)

local function fail(why) print("FAILED " .. kind .. " " .. (id or "") .. ": " .. why) end

-- The number of a control among all of them; its symbol is its label in small letters.
local function control_of(plugin, symbol)
    local number = 0
    for i = 0, plugin:parameter_count() - 1 do
        local label = plugin:parameter_label(i):lower():gsub("[^%w]+", "_")
        if label == symbol then return number end
        if plugin:parameter_is_control(i) then number = number + 1 end
    end
end

local function put_in_plugin()
    local track
    for route in session:new_audio_track(tonumber(channels), 2, nil, 1, "T",
            ARDOUR.PresentationInfo.max_order, ARDOUR.TrackMode.Normal, true):iter() do
        track = route
    end
    if channels == "1" then track:pan_azimuth_control():set_value(0, PBD.GroupControlDisposition.NoGroup) end
    if kind == "VST3" then
        local name = id
        id = nil
        for plugin in ARDOUR.LuaAPI.list_plugins():iter() do
            if plugin.type == ARDOUR.PluginType.VST3 and plugin.name == name then id = plugin.unique_id end
        end
    end
    local processor = id and ARDOUR.LuaAPI.new_plugin(session, id, ARDOUR.PluginType[kind], "")
    if not processor or processor:isnil() then return fail("Ardour does not know it") end
    if track:add_processor_by_index(processor, 0, nil, true) ~= 0 then return fail("Ardour cannot put it into a track") end
    local plugin = processor:to_insert():plugin(0)
    if preset ~= "" then
        local record = plugin:preset_by_label(preset)
        if not record or not plugin:load_preset(record) then fail("Ardour cannot load the preset " .. preset) end
    end
    for symbol, value in values:gmatch("([%w_]+)=(%S+)") do
        local control = control_of(plugin, symbol)
        if not control or not ARDOUR.LuaAPI.set_plugin_insert_param(processor:to_insert(), control, tonumber(value)) then
            fail("Ardour cannot set " .. symbol)
        end
    end
    print("LATENCY " .. processor:to_insert():signal_latency())
end

put_in_plugin()
-- What Lua still holds of a session that is closed, Ardour destroys in freed memory.
collectgarbage()
session:save_state("t", false, false, false, false, false)
close_session()
