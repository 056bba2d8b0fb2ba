/**
 * @file
 * What becomes of a request's record: a line of the log and a count.
 */
#pragma once

#include "host/server/Log.h"
#include "host/server/Statistics.h"
#include "host/wbem/Service.h"

#include <string>

namespace marlo::server {

/** "ok", "CIM_ERR_NOT_FOUND", "HTTP 400" where it did not come to a CIM operation, "client gone". */
std::string resultOf(const wbem::Record& record);

/** Any thread. */
class RequestLog {
  public:
    /** Both outlive this. */
    RequestLog(Log& log, Statistics& statistics) : _log(log), _statistics(statistics) {}

    void write(const wbem::Record& record);

  private:
    Log& _log;
    Statistics& _statistics;
};

} // namespace marlo::server
