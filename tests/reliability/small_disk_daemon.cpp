#include "small_disk_daemon.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <stdexcept>
#include <thread>

#include "quordaemon/domain_sock_connection.h"
#include "support/descriptor.h"
#include "support/files.h"

namespace quorelastic::testing {

SmallDiskDaemon::SmallDiskDaemon(uint64_t disk_bytes) {
  const std::string disk = folder_ / "disk";
  std::filesystem::create_directory(disk);
  // The shell leaves the process id that the daemon keeps.
  process_ = std::make_unique<Process>(std::vector<std::string>{
      "bwrap", "--die-with-parent", "--dev-bind", "/", "/", "--size", std::to_string(disk_bytes), "--tmpfs",
      disk, "--", "sh", "-c", "echo $$ > \"$0\"; exec \"$@\"", folder_ / "pid", QUORELASTICD_PROGRAM,
      "--socket", socket(), "--data", disk + "/data"});
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (!quordaemon::DomainSockConnection(socket()).Connect()) {
    if (std::chrono::steady_clock::now() > give_up) {
      throw std::runtime_error("the daemon does not begin to serve: " + process_->Err());
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
  pid_ = std::stoi(ReadFile(folder_ / "pid"));
}

std::string SmallDiskDaemon::disk() const {
  return "/proc/" + std::to_string(pid_) + "/root" + folder_ / "disk";
}

uint64_t SmallDiskDaemon::FreeBytes() const {
  struct statvfs status {};
  if (statvfs(disk().c_str(), &status) != 0) throw std::runtime_error("cannot examine " + disk());
  return status.f_bavail * status.f_frsize;
}

void SmallDiskDaemon::WriteBallast(const std::string& name, uint64_t bytes) const {
  const std::string path = disk() + "/" + name;
  const Descriptor file(open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600));
  if (file.get() < 0) throw std::runtime_error("cannot create " + path);
  const std::string block(4096, 'x');
  while (bytes >= block.size() && write(file.get(), block.data(), block.size()) > 0) bytes -= block.size();
}

void SmallDiskDaemon::RemoveBallast(const std::string& name) const {
  const std::string path = disk() + "/" + name;
  if (unlink(path.c_str()) != 0) throw std::runtime_error("cannot remove " + path);
}

int SmallDiskDaemon::Stop() {
  kill(pid_, SIGTERM);
  return process_->Wait().status;
}

}  // namespace quorelastic::testing
