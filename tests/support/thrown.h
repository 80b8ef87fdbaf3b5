#pragma once

#include "b_exception.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>

namespace stream_tests {

/// The exception of kind E that `action` throws; empty, after a test failure, when none is.
template <class E, class Action>
std::optional<E> thrown(Action&& action) {
  try {
    action();
  } catch (const E& error) {
    return error;
  }
  ADD_FAILURE() << "nothing thrown";
  return std::nullopt;
}

/// The message of the failure that `action` throws.
template <class Action>
std::string thrownText(Action&& action) {
  const auto error = thrown<base::exception>(action);
  return error ? error->what() : "nothing thrown";
}

}  // namespace stream_tests
