// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/Outcome.h"

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"

namespace NANDInfo {

std::optional<std::string> failureOf(const Outcome& outcome) {
  const auto messageOr = [](const std::string& otherwise) {
    const std::string message = GetAPIErrorMessage();
    return message == "NA" ? otherwise : message;
  };
  if (outcome.error) return outcome.error->text;
  if (!outcome.value) return messageOr("there is no result");
  const auto* dictionary = outcome.value->as<plist::Dictionary>();
  if (dictionary == nullptr) return std::nullopt;
  if (dictionary->find(kNANDInfoErrorKey) != nullptr) {
    return messageOr(description(dictionary->find(kNANDInfoErrorMessageKey)));
  }
  if (dictionary->size() == 1 && dictionary->find(kTLM_APIErrorMessage) != nullptr) {
    return messageOr("the result is empty");
  }
  return std::nullopt;
}

std::string withReasons(std::string why, const std::vector<std::string>& reasons) {
  for (const std::string& reason : reasons) {
    why += (&reason == &reasons.front() ? ": " : "; ") + reason;
  }
  return why;
}

}  // namespace NANDInfo
