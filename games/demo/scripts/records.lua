-- Lantern Demo: the table of records (gui.xml, window "records"): ten places under a title row,
-- the best first, the newest entry selected. main.lua loads this file; R in the first window,
-- the chooser's "Records" and the end of the level open it (scripts/profiles.lua).

Records = Records or {}
RecordsWnd = RecordsWnd or {}

local function S(value)
    if type(value) == "userdata" then
        return value.c_str()
    end
    return tostring(value)
end

local function records() return k17.g_RecordTable.Instance() end

local function set(wnd, id, text)
    local widget = wnd.GetWidget(id, true)
    if widget then
        demo.SetText(widget, text)
    end
end

function Records.Open()
    local wnd = demo.OpenWindow("records")
    if wnd then
        print("Lantern Demo: the records open")
        Records.Fill(wnd)
    end
end

-- Row n of the table (after the title, row 0) is place n.
function Records.Fill(wnd)
    local it, place = records().GetRecords(), 1
    while not it.IsEnd() and place <= 10 do
        local record = it.Get()
        set(wnd, "place" .. place, place .. ".")
        set(wnd, "name" .. place, S(record.Name))
        set(wnd, "score" .. place, tostring(record.Score))
        place = place + 1
        it.Next()
    end
    local last = records().GetLastRecordPos()
    local table_widget = wnd.GetWidget("records_table", true)
    if table_widget and last >= 1 and last <= 10 then
        ox.gui.CTableWidget.Cast(table_widget).SelectRow(last)
    end
end

function RecordsWnd.OnChildAction(wnd, action, sender)
    if S(sender.GetId()) == "close_records" then
        wnd.GetParentWindow().RemoveChildWindow()
    elseif S(action) == "row_selected" then
        print("Lantern Demo: records row " .. ox.gui.CTableWidget.Cast(sender).GetSelectedRow() .. " selected")
    end
    return true
end
