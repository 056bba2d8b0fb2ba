-- wrk posts the file that BODY names, with the fields that FIELDS names, one on a line.
wrk.method = "POST"
local file = io.open(os.getenv("BODY"), "rb")
wrk.body = file:read("*a")
file:close()
for line in io.lines(os.getenv("FIELDS")) do
    local name, value = line:match("^([^:]+): (.*)$")
    wrk.headers[name] = value
end
