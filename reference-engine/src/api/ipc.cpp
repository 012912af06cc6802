// ipc.h: shared-memory transports and the segments they run over. Every
// member logs its call, then forwards to the engine's transport state or to
// the segment functions (ipc/manager.h).
#include <cstdio>

#include "core/entry.h"
#include "core/messages.h"
#include "ipc/manager.h"
#include "ipc/transport.h"
#include "tarsel/errors.h"
#include "tarsel/ipc.h"

using Tarsel::IPC::MessageHeader_t;
using Tarsel::IPC::ShmemError;
using Tarsel::IPC::ShmemManager;
using Tarsel::IPC::ShmemTransport;
using tarsel_ref::ipc::Deadline;
using tarsel_ref::ipc::Endpoint;
using tarsel_ref::ipc::Mapping;

namespace {

const void *pointer(const void *address) { return address; }

}  // namespace

void free_tarsel_ipc_shmemtransport(ShmemTransport *transport) {
  auto scope = tarsel_ref::enter("free_tarsel_ipc_shmemtransport", static_cast<const void *>(transport));
  if (!transport) return;
  if (!tarsel_ref::ipc::unregister_endpoint(transport)) {
    tarsel_ref::emit_message(Err_Error, "free_tarsel_ipc_shmemtransport: not a live transport of this engine");
    return;
  }
  delete transport;
}

const char *Tarsel::IPC::shmem_error_to_string(ShmemError error) {
  auto scope = tarsel_ref::enter("shmem_error_to_string", static_cast<int>(error));
  return tarsel_ref::ipc::error_text(error);
}

// The transports are made here, where ShmemManager may construct them.
ShmemTransport *ShmemManager::serve(const char *const name, size_t size1, size_t size2) {
  auto scope = tarsel_ref::enter("ShmemManager::serve", name, size1, size2);
  return tarsel_ref::ipc::serve_segment(
      name, size1, size2, [](const Mapping &mapping, bool server, const std::string &object, Endpoint **endpoint) {
        auto *impl = new ShmemTransport::Impl(mapping, server, object);
        *endpoint = impl;
        return new ShmemTransport(impl);
      });
}

ShmemTransport *ShmemManager::connect(const char *const name) {
  auto scope = tarsel_ref::enter("ShmemManager::connect", name);
  return tarsel_ref::ipc::connect_segment(
      name, [](const Mapping &mapping, bool server, const std::string &object, Endpoint **endpoint) {
        auto *impl = new ShmemTransport::Impl(mapping, server, object);
        *endpoint = impl;
        return new ShmemTransport(impl);
      });
}

void ShmemManager::reset(const char *const name, bool flag) {
  auto scope = tarsel_ref::enter("ShmemManager::reset", name, flag);
  tarsel_ref::ipc::reset_segment(name, flag);
}

void ShmemManager::reset_all(bool flag) {
  auto scope = tarsel_ref::enter("ShmemManager::reset_all", flag);
  tarsel_ref::ipc::reset_all_segments(flag);
}

ShmemManager::ShmemManager() {
  auto scope = tarsel_ref::enter("ShmemManager::ShmemManager", static_cast<const void *>(this));
}

ShmemManager::ShmemManager(const ShmemManager &other) {
  auto scope = tarsel_ref::enter("ShmemManager::ShmemManager", static_cast<const void *>(this),
                                 static_cast<const void *>(&other));
}

ShmemManager &ShmemManager::operator=(const ShmemManager &other) {
  auto scope =
      tarsel_ref::enter("ShmemManager::operator=", static_cast<const void *>(this), static_cast<const void *>(&other));
  return *this;
}

ShmemManager::~ShmemManager() {
  tarsel_ref::note_entry("ShmemManager::~ShmemManager", static_cast<const void *>(this));
}

ShmemTransport::ShmemTransport(Impl *impl) : impl_(impl) {}

ShmemTransport::~ShmemTransport() { delete impl_; }

size_t ShmemTransport::read(void **data, MessageHeader_t **header) {
  auto scope = tarsel_ref::enter("ShmemTransport::read", pointer(this), pointer(data), pointer(header));
  return impl_->receive(data, header, Deadline::forever());
}

size_t ShmemTransport::try_read(void **data, MessageHeader_t **header) {
  auto scope = tarsel_ref::enter("ShmemTransport::try_read", pointer(this), pointer(data), pointer(header));
  return impl_->receive(data, header, Deadline::none());
}

size_t ShmemTransport::timed_read(void **data, float timeout, MessageHeader_t **header) {
  auto scope = tarsel_ref::enter("ShmemTransport::timed_read", pointer(this), pointer(data), timeout, pointer(header));
  return impl_->receive(data, header, Deadline::after(timeout));
}

size_t ShmemTransport::read_and_retry(void **data, float timeout, MessageHeader_t **header) {
  auto scope =
      tarsel_ref::enter("ShmemTransport::read_and_retry", pointer(this), pointer(data), timeout, pointer(header));
  return impl_->receive_retrying(data, header, timeout);
}

void *ShmemTransport::reserve(size_t size, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::reserve", pointer(this), size, desc);
  return impl_->reserve(size, desc, Deadline::forever());
}

void *ShmemTransport::try_reserve(size_t size, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::try_reserve", pointer(this), size, desc);
  return impl_->reserve(size, desc, Deadline::none());
}

void *ShmemTransport::timed_reserve(size_t size, float timeout, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::timed_reserve", pointer(this), size, timeout, desc);
  return impl_->reserve(size, desc, Deadline::after(timeout));
}

bool ShmemTransport::write(const void *data, size_t size, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::write", pointer(this), pointer(data), size, desc);
  return impl_->send(data, size, desc, Deadline::forever());
}

bool ShmemTransport::try_write(const void *data, size_t size, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::try_write", pointer(this), pointer(data), size, desc);
  return impl_->send(data, size, desc, Deadline::none());
}

bool ShmemTransport::timed_write(const void *data, size_t size, float timeout, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::timed_write", pointer(this), pointer(data), size, timeout, desc);
  return impl_->send(data, size, desc, Deadline::after(timeout));
}

bool ShmemTransport::write_string(const char *const text, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::write_string", pointer(this), text, desc);
  return impl_->send_text(text, desc, Deadline::forever());
}

bool ShmemTransport::try_write_string(const char *const text, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::try_write_string", pointer(this), text, desc);
  return impl_->send_text(text, desc, Deadline::none());
}

bool ShmemTransport::timed_write_string(const char *const text, float timeout, const char *const desc) {
  auto scope = tarsel_ref::enter("ShmemTransport::timed_write_string", pointer(this), text, timeout, desc);
  return impl_->send_text(text, desc, Deadline::after(timeout));
}

bool ShmemTransport::commit() {
  auto scope = tarsel_ref::enter("ShmemTransport::commit", pointer(this));
  return impl_->commit();
}

bool ShmemTransport::remove() {
  auto scope = tarsel_ref::enter("ShmemTransport::remove", pointer(this));
  return impl_->remove();
}

bool ShmemTransport::is_segment_valid() {
  auto scope = tarsel_ref::enter("ShmemTransport::is_segment_valid", pointer(this));
  return impl_->segment_valid();
}

pid_t ShmemTransport::get_server_pid() {
  auto scope = tarsel_ref::enter("ShmemTransport::get_server_pid", pointer(this));
  return impl_->server_pid();
}

bool ShmemTransport::client_pid_exists() {
  auto scope = tarsel_ref::enter("ShmemTransport::client_pid_exists", pointer(this));
  return impl_->client_exists();
}

void ShmemTransport::print_stats() {
  auto scope = tarsel_ref::enter("ShmemTransport::print_stats", pointer(this));
  impl_->print_stats();
}

ShmemError ShmemTransport::get_last_error() {
  auto scope = tarsel_ref::enter("ShmemTransport::get_last_error", pointer(this));
  return impl_->last_error();
}
