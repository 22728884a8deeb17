// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A device registry in memory, whose drivers follow a script.
//
// A test sets the entries and either the script (every driver call in order, with its answer) or
// the standing answers, runs the code, and expects problems() to be empty: no call that the script
// doesn't have, none left over, every handle given back once.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "platform/DeviceRegistry.h"

namespace platform::fakes {

class FakeDeviceRegistry : public DeviceRegistry, public DriverConnections {
 public:
  using Bytes = std::vector<std::byte>;

  struct Entry {
    std::string className;
    std::vector<std::string> conforms = {};  // further classes
    bool registered = true;                  // else only a walk finds it
    plist::Dictionary properties = {};
    std::vector<Entry> children = {};

    DriverStatus openStatus = 0, closeStatus = 0;
    bool oddHandle = false;  // opening gives none on success, or one on an error
  };

  struct Answer {
    DriverStatus status = 0;
    Bytes output = {};                            // struct methods; cut to the capacity
    std::optional<std::size_t> claimedSize = {};  // instead of what was delivered
    std::uint64_t scalar = 0;                     // scalar methods
  };

  // A driver call in words: "8 size 13/0" and "8 data 13/0" are the phases of a tunnel command
  // (method, op type, argument), "5" is a struct method without input, "3(1682065731)" a scalar
  // method.
  struct Step {
    std::string call;
    Answer answer;
  };

  static constexpr DriverStatus kUnsupported = 0x2D;

  // The root of the service plane, without its children none.
  std::optional<Entry> root = Entry{"Root"};
  bool canIterate = true;

  std::deque<Step> script;

  // The answers for when there is no script, by call; other calls are refused with kUnsupported.
  std::map<std::string, Answer> standing;

  // Adds a child to the root.
  Entry& add(Entry entry);

  // Both phases of a tunnel command that goes well: next in the script, or whenever it comes.
  void willTunnel(std::uint32_t method, std::uint32_t opType, std::uint32_t argument,
                  const Bytes& bytes);
  void alwaysTunnels(std::uint32_t method, std::uint32_t opType, std::uint32_t argument,
                     const Bytes& bytes);

  // The answer of a size phase.
  static Answer announce(std::uint32_t size);

  // Everything that went wrong so far, with what is still open or outstanding now.
  std::vector<std::string> problems() const;

  // Every driver call so far, and every opening as "open <class>".
  std::vector<std::string> calls;

  // The input of every struct method.
  std::vector<Bytes> inputs;

  RegistryObject DrvGetMatchingService(std::string_view className) override;
  RegistryObject rootEntry() override;
  RegistryObject createIterator() override;
  RegistryObject next(RegistryObject iterator) override;
  bool conformsTo(RegistryObject entry, std::string_view className) override;
  std::optional<plist::Value> searchProperty(RegistryObject entry, std::string_view key,
                                             Direction direction) override;
  void release(RegistryObject object) override;

  OpenResult DrvServiceOpen(RegistryObject service, std::uint32_t type) override;
  DriverStatus DrvServiceClose(DriverConnection connection) override;
  CallResult DrvCallStructMethod(DriverConnection connection, std::uint32_t method,
                                 std::span<const std::byte> input,
                                 std::span<std::byte> output) override;
  DriverStatus DrvCallMethod(DriverConnection connection, std::uint32_t method,
                             std::span<const std::uint64_t> input,
                             std::span<std::uint64_t> output) override;

 private:
  struct Handle {
    enum class Kind { entry, iterator, connection } kind;
    const Entry* entry;              // none of an iterator
    std::vector<const Entry*> walk;  // what an iterator has left, the next one last
  };

  RegistryObject handOut(Handle handle);
  Handle* find(std::uint32_t handle, Handle::Kind kind, const char* user);
  Answer answer(DriverConnection connection, const std::string& call);

  std::map<std::uint32_t, Handle> open_;
  std::uint32_t lastHandle_ = 0;
  std::vector<std::string> problems_;
};

}  // namespace platform::fakes
