#include <string_view>
#include <vector>

#include "Require.h"
#include "common/AppInfoList.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/messages/MessageFraming.h"

using namespace vesprun;

namespace {

/// The documents that a peer's bytes hold, when they arrive in pieces of this size.
std::vector<std::string> documentsOf(std::string_view bytes, std::size_t piece) {
  std::vector<std::string> documents;
  MessageAssembler assembler;
  while (!bytes.empty()) {
    std::string_view arrived = bytes.substr(0, piece);
    bytes.remove_prefix(arrived.size());
    while (!arrived.empty()) {
      const MessageAssembler::Progress progress = assembler.take(arrived);
      if (progress == MessageAssembler::Progress::TooLong) {
        return documents;
      }
      if (progress == MessageAssembler::Progress::Complete) {
        documents.push_back(assembler.takeDocument());
      }
    }
  }
  return documents;
}

}  // namespace

/// The pieces in which bytes arrive make no difference, and what a message holds is read.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(bytes), size);
  const std::vector<std::string> documents = documentsOf(text, size + 1);
  for (const std::size_t piece : {1U, 3U, 7U}) {
    require(documentsOf(text, piece) == documents, "pieces make no difference");
  }
  std::string error;
  for (const std::string& document : documents) {
    const auto value = readPtree(document, error);
    const PropertyDict* const message = value ? value->dict() : nullptr;
    if (message != nullptr && message->find("data") != nullptr) {
      std::size_t apps = 0;
      AppInfoList(message->find("data")).forEach([&apps](const PropertyDict&) {
        return ++apps > 0;
      });
      require(apps <= document.size(), "no more apps than the message has");
    }
  }
  return 0;
}
