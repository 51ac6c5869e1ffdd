#pragma once

#include <exception>
#include <string>

namespace zm::test {

/// Text of the exception that a call raises; "nothing raised" without one. One of another kind
/// passes.
template <typename TError = std::exception, typename TCall>
std::string MessageOf(TCall call) {
    try {
        call();
    } catch (const TError& error) {
        return error.what();
    }
    return "nothing raised";
}

}  // namespace zm::test
