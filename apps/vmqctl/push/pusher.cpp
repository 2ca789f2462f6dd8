// Sends files.

#include "apps/vmqctl/push/pusher.h"

#include <algorithm>
#include <climits>
#include <iterator>

#include "apps/vmqctl/commands/result.h"
#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/push/arrival_digest.h"

namespace vmqctl {
namespace {

constexpr const char* versionHint = "Check that vmqd and vmqctl are of the same version.";
constexpr const char* againHint = "Push again: each file is begun anew.";

struct Status {
  std::uint32_t code;
  const char* meaning;
};

constexpr std::uint32_t blockNotWritten = 5;
constexpr Status statuses[] = {
    {1, "it has no usable depot directory"},
    {3, "the destination path is longer than 1024 characters"},
    {4, "the destination file could not be opened"},
    {blockNotWritten, "a block could not be written, as on a full disk"},
    {6, "the destination directory could not be created"},
};

std::string inWords(std::uint32_t status) {
  const auto* const known =
      std::find_if(std::begin(statuses), std::end(statuses), [&](const Status& s) { return s.code == status; });
  return "The machine answers with status " + std::to_string(status) + ": " +
         (known == std::end(statuses) ? "vmqctl does not know it" : known->meaning) + ".";
}

std::uint32_t statusIn(const RpcReply& reply) {
  constexpr std::size_t statusBytes = 4;
  if (reply.body.size() != statusBytes) {
    throw AnswerLost(ExitCode::Failed,
                     "The daemon's answer has " + std::to_string(reply.body.size()) + " bytes in place of a status.",
                     versionHint);
  }
  std::uint32_t status = 0;
  for (std::size_t i = 0; i < statusBytes; ++i) {
    const std::size_t at = reply.littleEndian ? statusBytes - 1 - i : i;
    status = status << CHAR_BIT | static_cast<unsigned char>(reply.body[at]);
  }
  return status;
}

}  // namespace

Pusher::Pusher(Session& session, const PushPlan& plan, bool verify)
    : Pusher(session, plan, verify, askForService(session)) {}

Pusher::Pusher(Session& session, const PushPlan& plan, bool verify, const Service& service)
    : session_(session), plan_(plan), verify_(verify), depot_(service.depot), packet_(service.maximumPacketBytes) {
  plan_.checkFits(depot_, packet_.chunkBytes());
  session_.progress.follow([this] { return transferLine(state()); });
}

Pusher::Service Pusher::askForService(Session& session) {
  session.progress.turn("asking vmqd how it takes files");
  const Json daemon = session.client.get("/v1");
  Service service;
  service.depot = textIn(daemon, "depot");
  if (service.depot.empty()) service.depot = textIn(daemon, "home");
  if (service.depot.empty()) {
    throw Failure(ExitCode::Failed, "The daemon has no depot and no home; nothing was sent.",
                  "Set home in the daemon's configuration.");
  }
  if (service.depot.back() != '/') service.depot += '/';

  const auto maximum = daemon.find("maximum_packet_bytes");
  if (maximum == daemon.end() || !maximum->is_number_unsigned()) {
    throw Failure(ExitCode::Failed, "The daemon does not say that it takes files; nothing was sent.", versionHint);
  }
  service.maximumPacketBytes = maximum->get<std::size_t>();
  if (service.maximumPacketBytes < Packet::smallestBytes) {
    throw Failure(ExitCode::Failed,
                  "The daemon takes packets of " + std::to_string(service.maximumPacketBytes) +
                      " bytes at most, and the smallest piece of a file takes " +
                      std::to_string(Packet::smallestBytes) + "; nothing was sent.",
                  "Raise maximum_packet_bytes in its configuration.");
  }
  return service;
}

Pusher::~Pusher() {
  session_.progress.turn("");
}

void Pusher::run() {
  try {
    while (sent_.size() < plan_.files().size()) send(current());
  } catch (const Interrupted&) {
    throw Failure(ExitCode::Interrupted, "Interrupted at " + where() + ". " + whatIsLeft(), againHint);
  } catch (const TimedOut&) {
    throw Failure(ExitCode::TimedOut,
                  "The time of --timeout, " + counted(session_.timeoutSeconds, "second") + ", was over at " + where() +
                      ". " + whatIsLeft(),
                  std::string("Allow it more with --timeout. ") + againHint);
  } catch (const Failure& failure) {
    const std::string next = failure.next().empty() ? againHint : failure.next() + " " + againHint;
    throw Failure(failure.code(), where() + ": " + failure.what() + " " + whatIsLeft(), next);
  }
}

void Pusher::send(const PlannedFile& file) {
  stage_ = Stage::Reading;
  chunk_ = 1;
  chunks_ = chunksOf(file.bytes, packet_.chunkBytes());
  SourceFile source(file.source);
  chunks_ = chunksOf(source.bytes(), packet_.chunkBytes());
  if (chunks_ > INT32_MAX) throw Failure(ExitCode::Failed, file.source + " has become too large.");

  ArrivalDigest arrival(isConverted(depot_ + file.name));
  std::uint64_t left = source.bytes();
  for (;; ++chunk_) {
    stage_ = Stage::Reading;
    const std::size_t count = std::min<std::uint64_t>(left, packet_.chunkBytes());
    packet_.begin(file.name, static_cast<std::int32_t>(chunk_), count);
    source.read(packet_.pieces());
    if (chunk_ == chunks_) source.checkUnchanged();
    sendPacket();
    bytes_ += count;
    left -= count;
    if (verify_) {
      for (const iovec& piece : packet_.pieces()) arrival.add({static_cast<char*>(piece.iov_base), piece.iov_len});
    }
    if (chunk_ == chunks_) break;
  }

  std::string sha256;
  if (verify_) {
    stage_ = Stage::Verifying;
    sha256 = arrival.sha256();
    verify(file, arrival.bytes(), sha256);
  }
  sent_.push_back({file, source.bytes(), chunks_, sha256});
  if (!session_.console.err().sequences) {
    session_.console.line((verify_ ? "sent and verified " : "sent ") + file.name + " (" + inBytes(source.bytes()) +
                          ")");
  }
}

void Pusher::sendPacket() {
  stage_ = Stage::Sending;
  std::uint32_t status = 0;
  try {
    status = statusIn(session_.client.call(Packet::interfaceId, Packet::operation, packet_.bytes()));
  } catch (const AnswerLost&) {
    throw;
  } catch (const Failure&) {
    stage_ = Stage::Refused;
    throw;
  }
  ++calls_;
  if (status == 0) return;
  stage_ = status == blockNotWritten ? Stage::Broken : Stage::Refused;
  throw Failure(ExitCode::Failed, inWords(status), "The daemon's trace log says more.");
}

void Pusher::verify(const PlannedFile& file, std::uint64_t bytes, const std::string& sha256) {
  const std::optional<DepotFile> there = session_.client.depotFile(file.name);
  if (there && there->bytes == bytes && there->sha256 == sha256) return;
  const std::string found =
      there ? "has " + std::to_string(there->bytes) + " bytes with the SHA-256 " + there->sha256 : "is not there";
  throw Failure(ExitCode::Failed,
                "What was stored is not what was sent: it " + found + " instead of " + std::to_string(bytes) +
                    " bytes with " + sha256 + ".",
                isConverted(depot_ + file.name)
                    ? "Its line ends are converted on the machine; the daemon's trace log tells when that fails."
                    : "Another client may have pushed the same file.");
}

double Pusher::seconds() const {
  return std::chrono::duration<double>(std::chrono::steady_clock::now() - begun_).count();
}

std::string Pusher::where() const {
  return current().name +
         (stage_ == Stage::Verifying ? "" : ", chunk " + std::to_string(chunk_) + " of " + std::to_string(chunks_));
}

std::string Pusher::whatIsLeft() const {
  const bool maybeWhole = chunk_ == chunks_;
  std::string sentence;
  switch (stage_) {
    case Stage::Reading:
    case Stage::Refused:
      sentence = chunk_ == 1 ? "Nothing of it was stored" : "The file is incomplete on the machine";
      break;
    case Stage::Sending:
      sentence = chunk_ == 1 || maybeWhole ? "The file may be incomplete on the machine"
                                           : "The file is incomplete on the machine";
      break;
    case Stage::Broken:
      sentence = "The file is incomplete on the machine";
      break;
    case Stage::Verifying:
      sentence = "The file was sent, but is not verified";
      break;
  }
  if (plan_.files().size() == 1) return sentence + ".";
  return sentence + "; " + std::to_string(sent_.size()) + " of " + counted(plan_.files().size(), "file") +
         " arrived before it.";
}

TransferState Pusher::state() const {
  const bool ended = sent_.size() == plan_.files().size();
  return {bytes_,
          plan_.bytes(),
          sent_.size() + (ended ? 0 : 1),
          plan_.files().size(),
          ended ? plan_.files().back().name : current().name,
          std::chrono::steady_clock::now() - begun_,
          !ended && stage_ == Stage::Verifying};
}

Json Pusher::report() const {
  const bool ended = sent_.size() == plan_.files().size();
  Json files = Json::array();
  for (const Sent& each : sent_) {
    files.push_back({{"name", each.file.name},
                     {"source", each.file.source},
                     {"bytes", each.bytes},
                     {"chunks", each.chunks},
                     {"sha256", each.sha256.empty() ? Json() : Json(each.sha256)}});
  }
  return {{"result", ended ? "done" : "failed"},
          {"depot", depot_},
          {"bytes", bytes_},
          {"calls", calls_},
          {"seconds", seconds()},
          {"files", std::move(files)},
          {"stopped_at", ended ? Json() : Json(current().name)}};
}

std::string Pusher::summary() const {
  return "sent " + counted(sent_.size(), "file") + " (" + inBytes(bytes_) + ") to " + depot_;
}

}  // namespace vmqctl
