-- What every milter script shares: the socket from the environment, a connection, and a mail
-- file sent as an MTA sends it (header fields one by one, the body with CRLF line ends in
-- chunks of at most 64 KB), with a check that the milter answered each step.
local common = {}

common.header = "X-Pelmix-Verdict"

function common.env(name)
  local value = os.getenv(name)
  if value == nil or value == "" then error("the environment lacks " .. name) end
  return value
end

-- miltertest exits 1 on an error without saying what it was: this says it first.
function common.run(body)
  local ok, err = xpcall(body, function(e) return debug.traceback(tostring(e), 2) end)
  if not ok then
    mt.echo("FAIL: " .. err)
    error(err)
  end
end

function common.check(result, what)
  if result ~= nil then error(what .. " failed: " .. tostring(result)) end
end

function common.connect()
  local conn = mt.connect(common.env("MILTER_SOCKET"), 40, 0.25)
  if conn == nil then error("cannot connect to " .. common.env("MILTER_SOCKET")) end
  common.check(mt.conninfo(conn, "localhost", "127.0.0.1"), "conninfo")
  if mt.getreply(conn) ~= SMFIR_CONTINUE then error("the connection was not accepted") end
  return conn
end

local function read_file(path)
  local f = assert(io.open(path, "rb"))
  local data = f:read("a")
  f:close()
  return data
end

-- The header fields (name, value without the space after the colon; folded lines joined with
-- CRLF) and the body of an RFC 822 text.
function common.parse(text)
  local head, body = text:match("^(.-)\r?\n\r?\n(.*)$")
  if head == nil then head, body = text, "" end
  local fields = {}
  for line in (head .. "\n"):gmatch("(.-)\r?\n") do
    if line:match("^[ \t]") and #fields > 0 then
      fields[#fields].value = fields[#fields].value .. "\r\n" .. line
    else
      local name, value = line:match("^([^:]+):[ \t]?(.*)$")
      if name ~= nil then fields[#fields + 1] = {name = name, value = value} end
    end
  end
  body = body:gsub("\r\n", "\n"):gsub("\n", "\r\n")
  return fields, body
end

-- Sends one message: `extra` fields go first, `padding` bytes of text lines after the body.
-- Returns the milter's reply to end of message.
function common.send_text(conn, text, extra, padding)
  local fields, body = common.parse(text)
  common.check(mt.mailfrom(conn, "sender@example.org"), "mailfrom")
  for _, f in ipairs(extra or {}) do
    common.check(mt.header(conn, f.name, f.value), "header " .. f.name)
  end
  for _, f in ipairs(fields) do
    common.check(mt.header(conn, f.name, f.value), "header " .. f.name)
    if mt.getreply(conn) ~= SMFIR_CONTINUE then error("header " .. f.name .. " not taken") end
  end
  common.check(mt.eoh(conn), "eoh")
  local chunk = 65535
  for i = 1, #body, chunk do
    common.check(mt.bodystring(conn, body:sub(i, i + chunk - 1)), "body")
  end
  if padding ~= nil and padding > 0 then
    local line = string.rep("padding text ", 6) .. "\r\n"
    local block = string.rep(line, chunk // #line)
    local sent = 0
    while sent < padding do
      common.check(mt.bodystring(conn, block), "body padding")
      sent = sent + #block
    end
  end
  common.check(mt.eom(conn), "eom")
  return mt.getreply(conn)
end

function common.send_file(conn, path, extra, padding)
  return common.send_text(conn, read_file(path), extra, padding)
end

-- The cases file: one "PATH<TAB>EXPECTED HEADER VALUE" a line.
function common.cases(path)
  local cases = {}
  for line in io.lines(path) do
    local file, want = line:match("^([^\t]+)\t(.*)$")
    if file ~= nil then cases[#cases + 1] = {file = file, want = want} end
  end
  if #cases == 0 then error("no cases in " .. path) end
  return cases
end

return common
