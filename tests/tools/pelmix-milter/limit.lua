-- A milter started with --max-connections 1: a second connection is refused for now
-- (tempfail), and taken once the first has gone.
local common = dofile(os.getenv("MILTER_LUA_DIR") .. "/common.lua")
common.run(function()
  local first = common.connect()
  local second = mt.connect(common.env("MILTER_SOCKET"), 40, 0.25)
  if second == nil then error("no second connection") end
  common.check(mt.conninfo(second, "localhost", "127.0.0.1"), "conninfo")
  if mt.getreply(second) ~= SMFIR_TEMPFAIL then error("the second connection was served") end
  mt.disconnect(second, false)
  common.check(mt.disconnect(first), "disconnect")
  -- The first connection's end reaches the milter a moment later.
  for _ = 1, 40 do
    local third = mt.connect(common.env("MILTER_SOCKET"), 40, 0.25)
    common.check(mt.conninfo(third, "localhost", "127.0.0.1"), "conninfo")
    local reply = mt.getreply(third)
    mt.disconnect(third, false)
    if reply == SMFIR_CONTINUE then
      mt.echo("ok: refused while busy, served after")
      return
    end
    mt.sleep(0.25)
  end
  error("a connection after the first had gone was still refused")
end)
