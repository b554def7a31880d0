-- For wrk: each request comes from the next visitor, and an answer that is not the page is an
-- error. The figures are printed as one line of JSON.
--
--   wrk ... -s wrk.lua ADDRESS -- COOKIES LENGTH
--
-- COOKIES is a file with the cookies of one visitor in each line, LENGTH that of the page in bytes.

wrong = 0 -- global, for done() asks each thread for it

local requests = {}
local turn = 0
local length
local threads = {}

function setup(thread)
  threads[#threads + 1] = thread
end

function init(arguments)
  for cookies in io.lines(arguments[1]) do
    requests[#requests + 1] = wrk.format("GET", nil, {Cookie = cookies})
  end
  length = tonumber(arguments[2])
end

function request()
  turn = turn % #requests + 1
  return requests[turn]
end

function response(status, _, body)
  if status ~= 200 or #body ~= length then wrong = wrong + 1 end
end

function done(summary, latency)
  local all_wrong = 0
  for _, thread in ipairs(threads) do all_wrong = all_wrong + thread:get("wrong") end
  local broken = summary.errors
  print(string.format(
    '{"microseconds": %d, "answers": %d, "wrong": %d, "broken": %d, "p50": %d, "p99": %d}',
    summary.duration, summary.requests, all_wrong,
    broken.connect + broken.read + broken.write + broken.timeout,
    latency:percentile(50), latency:percentile(99)))
end
