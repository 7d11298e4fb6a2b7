-- One message and the milter's answer to it. MILTER_FILE is sent, after the fields MILTER_EXTRA
-- names ("forged": the sender's own X-Pelmix-Verdict fields in two letter cases; "bad": a
-- field name the MIME parser cannot read, so the message cannot be judged) and followed by
-- MILTER_PADDING bytes of text. MILTER_REPLY is the answer wanted (accept, reject, tempfail);
-- when accepted, MILTER_WANT is the X-Pelmix-Verdict wanted (its start, with
-- MILTER_WANT_PREFIX set).
local common = dofile(os.getenv("MILTER_LUA_DIR") .. "/common.lua")
common.run(function()
  local extra = {}
  local kind = os.getenv("MILTER_EXTRA") or ""
  if kind == "forged" then
    extra = {
      {name = "X-Pelmix-Verdict", value = "clean"},
      {name = "x-pelmix-verdict", value = "clean; weight=0"},
    }
  elseif kind == "bad" then
    extra = {{name = "bad name", value = "x"}}
  end
  local conn = common.connect()
  local reply = common.send_file(conn, common.env("MILTER_FILE"), extra,
                                 tonumber(os.getenv("MILTER_PADDING") or "0"))
  local want = common.env("MILTER_REPLY")
  if want == "accept" then
    if reply ~= SMFIR_ACCEPT then error("not accepted, reply " .. reply) end
    local value = common.env("MILTER_WANT")
    local got = mt.getheader(conn, common.header, 0)
    if os.getenv("MILTER_WANT_PREFIX") ~= nil then
      if got == nil or got:sub(1, #value) ~= value then
        error("header is " .. tostring(got) .. ", not " .. value .. "...")
      end
    elseif not mt.eom_check(conn, MT_HDRADD, common.header, value) then
      error("header is " .. tostring(got) .. ", not " .. value)
    end
    if mt.eom_check(conn, MT_HDRDELETE, common.header) ~= (kind == "forged") then
      error("incoming " .. common.header .. " removed: " .. tostring(not (kind == "forged")))
    end
  elseif want == "tempfail" then
    if reply ~= SMFIR_REPLYCODE then error("no reply code, reply " .. reply) end
    if not mt.eom_check(conn, MT_SMTPREPLY, "451", "4.7.1",
                            "Message could not be checked, please try again later") then error("no 451 4.7.1") end
    if mt.eom_check(conn, MT_HDRADD) then error("a header was added to a refused message") end
  else
    error("unknown MILTER_REPLY " .. want)
  end
  mt.echo("ok " .. want .. " " .. (os.getenv("MILTER_WANT") or ""))
  common.check(mt.disconnect(conn), "disconnect")
end)
