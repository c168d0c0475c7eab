#pragma once

#include <functional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "support/descriptor.h"

namespace quorelastic::testing {

// A message as it stands on the wire.
std::string Framed(const std::string& payload);

// The daemon's end of one connection, doing step by step what a script says. Each step waits for what it needs;
// a step that the tool's leaving makes impossible ends the script.
class PeerConnection {
 public:
  PeerConnection(Descriptor sock, int stop) : sock_(std::move(sock)), stop_(stop) {}

  void ReceiveRequest();            // one whole message
  void ReceiveBytes(size_t count);  // a part of one, or more than one
  void Reply(const std::string& payload);
  void Write(const std::string& bytes);    // as they are: half messages, several, none at all
  void Trickle(const std::string& bytes);  // one at a time
  void Close();                            // what was not received is lost to the tool

 private:
  friend class ScriptedPeer;

  void Await(short events) const;
  size_t ReceiveSome(size_t most);

  Descriptor sock_;
  int stop_;
  std::string received_;
};

// A daemon made for one run of the tool: listens at a path, accepts one connection and follows a script there,
// in a thread of its own. Unless the script closes the connection, it stays open until the tool leaves. What it
// listens at goes with it.
class ScriptedPeer {
 public:
  using Script = std::function<void(PeerConnection&)>;

  // Listens when this returns. Throws std::system_error where that cannot be done.
  ScriptedPeer(const std::string& path, Script script);
  // Receives one request, then sends these replies.
  ScriptedPeer(const std::string& path, const std::vector<std::string>& replies);
  ScriptedPeer(const ScriptedPeer&) = delete;
  ScriptedPeer& operator=(const ScriptedPeer&) = delete;
  ~ScriptedPeer();

  // To be asked when the tool has ended. Every byte that it sent, and how many connections it made.
  const std::string& Received();
  int Connections();

 private:
  void Serve(const Script& script);
  bool Accept(Descriptor& accepted) const;
  void Finish();

  std::string path_;
  Descriptor listening_;
  Descriptor stop_;  // an eventfd: from now on nothing is waited for
  std::string received_;
  int connections_ = 0;
  std::thread thread_;
};

}  // namespace quorelastic::testing
