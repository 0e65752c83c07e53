-- For wrk: posts the message in the file REQUEST, as the user that CREDENTIALS names (base64), and prints one row of
-- figures. An answer that is no success counts as an error: a fast refusal must not pass for speed.
local file = assert(io.open(assert(os.getenv("REQUEST")), "rb"))
wrk.method = "POST"
wrk.body = file:read("*a")
file:close()
wrk.headers["Content-Type"] = 'application/xml; charset="utf-8"'
wrk.headers["CIMOperation"] = "MethodCall"
wrk.headers["CIMMethod"] = os.getenv("METHOD")
wrk.headers["CIMObject"] = os.getenv("OBJECT")
wrk.headers["Authorization"] = "Basic " .. assert(os.getenv("CREDENTIALS"))

local threads = {}

function setup(thread)
    table.insert(threads, thread)
end

function init()
    expected = os.getenv("EXPECTED")
    failures = 0
end

function response(status, _, body)
    if status ~= 200 or not body:find(expected, 1, true) then
        failures = failures + 1
    end
end

function done(summary, latency)
    local errors = summary.errors.connect + summary.errors.read + summary.errors.write + summary.errors.timeout
    for _, thread in ipairs(threads) do
        errors = errors + thread:get("failures")
    end
    io.write(string.format("%12.0f %10.2f %10.2f %8d\n", summary.requests / summary.duration * 1e6,
        latency:percentile(50) / 1000, latency:percentile(99) / 1000, errors))
end
