-- Says what wrk has measured as one line of JSON; the latencies in microseconds.
function done(summary, latency)
    local failures = summary.errors
    io.write(string.format(
        '\nmeasured {"requests": %d, "microseconds": %d, "bytes": %d, "p50": %d, "p99": %d, ' ..
        '"connect": %d, "read": %d, "write": %d, "status": %d, "timeout": %d}\n',
        summary.requests, summary.duration, summary.bytes, latency:percentile(50),
        latency:percentile(99), failures.connect, failures.read, failures.write, failures.status,
        failures.timeout))
end
