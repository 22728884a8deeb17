// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the storage controller and its neighbours answer to the commands, as entries of a device
// registry that answers the same.
#pragma once

#include <map>
#include <string>

#include "NANDInfo/Controller.h"
#include "NANDInfo/DriverService.h"
#include "base/Result.h"
#include "tools/nandinfo/CaptureFolder.h"
#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// Files of the captured folder are written as the answers come.
class ControllerCapture {
 public:
  ControllerCapture(const Invocation& invocation, CaptureFolder& folder)
      : invocation_(invocation), services_(invocation.services), folder_(folder) {}

  // Asks all that a command can ask. There must be a controller that can be opened.
  base::Result<void> run();

  // What came of it: the registry's entries, the class of the controller that was asked; what was
  // captured and what was not, for the manifest.
  plist::Array entries, buffers, leftOut;
  std::string className;

 private:
  struct BufferKind;
  static const BufferKind kKinds[];

  // How a command's argument is given to the driver.
  enum class ArgumentIn { word, flags };

  base::Result<void> captureController(const NANDInfo::nand_exporter_t& exporter,
                                       NANDInfo::DriverService service, bool registered);
  base::Result<void> captureBuffers(const NANDInfo::DriverService& service, const BufferKind& kind);
  base::Result<void> captureBuffer(const NANDInfo::DriverService& service, const BufferKind& kind,
                                   const NANDInfo::SelectorPair& selectors, std::uint32_t argument);
  void captureRecommendation(const NANDInfo::DriverService& service, plist::Dictionary& driver);
  void captureCharacteristics(const NANDInfo::DriverService& service, plist::Dictionary& entry);
  void captureEAN();
  void captureNVRAM();

  void leaveOut(std::string what, std::string reason);
  void leaveOut(const BufferKind& kind, std::uint32_t argument, std::string reason);

  const Invocation& invocation_;
  const NANDInfo::Services services_;
  CaptureFolder& folder_;
  const NANDInfo::nand_exporter_t* exporter_ = nullptr;  // the one that is asked
  plist::Dictionary answers_;                            // the driver's, by op type and argument
  std::map<std::string, std::string> files_;  // by their digests: what is equal is written once
  std::uint32_t firstLeftOut_ = 0, lastLeftOut_ = 0;  // arguments of the last entry of leftOut
  const BufferKind* kindLeftOut_ = nullptr;
};

}  // namespace nandinfo
