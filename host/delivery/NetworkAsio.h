/**
 * @file
 * What is inside of the network, for those sources that use the library.
 */
#pragma once

#include "host/delivery/Network.h"

#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>

namespace marlo::delivery {

struct Network::Asio {
    boost::asio::io_context context{1}; // one thread
    boost::asio::executor_work_guard<boost::asio::io_context::executor_type> guard{context.get_executor()};
};

} // namespace marlo::delivery
