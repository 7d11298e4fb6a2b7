-- Every case file through one connection; the answer must match the verdict `pelmix mail`
-- gives the same file, acted upon as MILTER_ACTION (tag, reject, quarantine) says.
local common = dofile(os.getenv("MILTER_LUA_DIR") .. "/common.lua")
common.run(function()
  local action = common.env("MILTER_ACTION")
  local conn = common.connect()

  for _, case in ipairs(common.cases(common.env("MILTER_CASES"))) do
    local reply = common.send_file(conn, case.file)
    local phishing = case.want:match("^phishing") ~= nil
    local where = case.file .. " (" .. action .. ", want " .. case.want .. "): "
    if action == "reject" and phishing then
      if reply ~= SMFIR_REPLYCODE then error(where .. "not rejected, reply " .. reply) end
      if not mt.eom_check(conn, MT_SMTPREPLY, "550", "5.7.1",
                          "Message refused: it was judged to be phishing") then
        error(where .. "no 550 5.7.1 reply")
      end
      if mt.eom_check(conn, MT_HDRADD, common.header) then error(where .. "tagged a rejected message") end
    else
      if reply ~= SMFIR_ACCEPT then error(where .. "not accepted, reply " .. reply) end
      if not mt.eom_check(conn, MT_HDRADD, common.header, case.want) then
        local got = mt.getheader(conn, common.header, 0)
        error(where .. "header is " .. tostring(got))
      end
      local quarantined = mt.eom_check(conn, MT_QUARANTINE)
      if quarantined ~= (action == "quarantine" and phishing) then
        error(where .. "quarantined: " .. tostring(quarantined))
      end
      if mt.eom_check(conn, MT_HDRDELETE) then error(where .. "deleted a header it did not get") end
    end
    mt.echo("ok " .. where)
  end
  common.check(mt.disconnect(conn), "disconnect")
end)
