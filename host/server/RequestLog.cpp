#include "host/server/RequestLog.h"

#include "host/cimom/ObjectManager.h"

namespace marlo::server {

namespace {

constexpr unsigned HttpOk = 200;

} // namespace

std::string resultOf(const wbem::Record& record) {
    if (record.httpStatus == 0) {
        return "client gone";
    }
    if (!record.cimStatus) {
        return record.httpStatus == HttpOk ? "ok" : "HTTP " + std::to_string(record.httpStatus);
    }
    return *record.cimStatus == CMPI_RC_OK ? "ok" : statusName(static_cast<CMPIrc>(*record.cimStatus));
}

void RequestLog::write(const wbem::Record& record) {
    const std::string result = resultOf(record);
    _statistics.count(record.operation, result, record.time);
    LogFields fields{
        {"id", record.id}, {"peer", record.peer}, {"user", record.user}, {"operation", record.operation}};
    const auto addText = [&fields](std::string_view name, const std::string& text) {
        if (!text.empty()) {
            fields.push_back({name, text});
        }
    };
    addText("namespace", record.nameSpace);
    addText("class", record.className);
    if (record.cimStatus) {
        fields.push_back({"status", std::uint64_t{*record.cimStatus}});
    }
    fields.push_back({"result", result});
    fields.push_back({"http", std::uint64_t{record.httpStatus}});
    fields.push_back({"us", static_cast<std::uint64_t>(record.time.count())});
    fields.push_back({"in", std::uint64_t{record.bytesIn}});
    fields.push_back({"out", std::uint64_t{record.bytesOut}});
    addText("error", record.error);
    for (const std::string& line : record.reported) {
        fields.push_back({"reported", line});
    }
    _log.write(result == "ok" ? LogLevel::info : LogLevel::warning, "request", fields);
}

} // namespace marlo::server
