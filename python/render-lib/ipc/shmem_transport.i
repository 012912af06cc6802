// One end of a shared-memory message transport, made by ShmemManager. Reads
// and reservations hand out memoryviews over the segment itself; writes pass
// the caller's buffer to the engine as it is. Nothing here releases the
// interpreter lock, also while a transport call waits; a signal ends the wait.

%{
// A memoryview over engine memory with no owner object: read-only for
// messages read, writable for space reserved. The view refers to the segment
// for as long as the transport keeps that memory for the message.
static PyObject *segment_view(void *address, size_t size, bool writable)
{
  Py_buffer view;
  if (PyBuffer_FillInfo(&view, NULL, address, (Py_ssize_t)size, writable ? 0 : 1,
                        writable ? PyBUF_CONTIG : PyBUF_CONTIG_RO) < 0) {
    PyErr_Clear();
    Py_RETURN_NONE;
  }
  return PyMemoryView_FromBuffer(&view);
}

static PyObject *message_view(size_t size, void *body)
{
  if (size == 0)
    Py_RETURN_NONE;
  return segment_view(body, size, false);
}

static PyObject *reserved_view(void *body, size_t size)
{
  if (!body)
    Py_RETURN_NONE;
  return segment_view(body, size, true);
}

// The buffer of a message to write, or false with TypeError set. The write
// functions return that false as their result with the error pending, so
// the interpreter reports a SystemError caused by the TypeError.
class MessageBytes {
public:
  MessageBytes(PyObject *msg, const char *operation) : held_(false)
  {
    PyBufferProcs *procs = Py_TYPE(msg)->tp_as_buffer;
    if (!procs || !procs->bf_getbuffer) {
      PyErr_Format(PyExc_TypeError, "in ShmemTransport::%s, msg must support the buffer protocol", operation);
      return;
    }
    if (PyObject_GetBuffer(msg, &view_, PyBUF_CONTIG_RO) < 0) {
      PyErr_Format(PyExc_TypeError, "in ShmemTransport::%s, unable to get Py_buffer view; maybe has no size?",
                   operation);
      return;
    }
    held_ = true;
  }
  ~MessageBytes()
  {
    if (held_)
      PyBuffer_Release(&view_);
  }
  MessageBytes(const MessageBytes &) = delete;
  MessageBytes &operator=(const MessageBytes &) = delete;
  bool ok() const { return held_; }
  const void *data() const { return view_.buf; }
  size_t size() const { return (size_t)view_.len; }
private:
  Py_buffer view_;
  bool held_;
};
%}

// The waiting calls: the blocking and timed forms.
// The engine ends a wait early, with nothing taken or sent, when a signal
// comes (Ctrl-C); the call then lets the interpreter run the
// signal's Python handler, so KeyboardInterrupt (or whatever it raises) comes
// from the call at once instead of after the wait. A handler that raises
// nothing leaves the call's own answer: None or False, with RETRY.
%typemap(ret, noblock=1) PyObject *SignalEndsWait {
  if ($result == Py_None && !PyErr_Occurred() && PyErr_CheckSignals() < 0) {
    Py_DECREF($result);
    return NULL;  // the arguments are freed already: not SWIG_fail
  }
}
%typemap(ret, noblock=1) bool SignalEndsWait {
  if (!result && !PyErr_Occurred() && PyErr_CheckSignals() < 0) {
    Py_DECREF($result);
    return NULL;  // the arguments are freed already: not SWIG_fail
  }
}
%apply PyObject *SignalEndsWait { PyObject *read_pybuf, PyObject *timed_read_pybuf, PyObject *read_pybuf_and_retry,
                                  PyObject *reserve_pybuf, PyObject *timed_reserve_pybuf };
%apply bool SignalEndsWait { bool write_pybuf, bool timed_write_pybuf, bool write_string, bool timed_write_string };

namespace Tarsel {
namespace IPC {

%nodefaultctor ShmemTransport;
%nodefaultdtor ShmemTransport;
class ShmemTransport {
public:
  bool write_string(const char *const text, const char *const desc = nullptr);
  bool try_write_string(const char *const text, const char *const desc = nullptr);
  bool timed_write_string(const char *const text, float timeout, const char *const desc = nullptr);
  bool commit();
  bool remove();
  bool is_segment_valid();
  // A process identifier, handed to Python as an opaque owned pid_t pointer.
  %apply pid_t OwnedProcessId { pid_t get_server_pid };
  pid_t get_server_pid();
  %clear pid_t get_server_pid;
  bool client_pid_exists();
  void print_stats();
  ShmemError get_last_error();
};

%extend ShmemTransport {
  ~ShmemTransport() { free_tarsel_ipc_shmemtransport($self); }

  PyObject *read_pybuf() {
    void *body = NULL;
    size_t size = $self->read(&body, NULL);
    return message_view(size, body);
  }
  PyObject *try_read_pybuf() {
    void *body = NULL;
    size_t size = $self->try_read(&body, NULL);
    return message_view(size, body);
  }
  PyObject *timed_read_pybuf(float timeout) {
    void *body = NULL;
    size_t size = $self->timed_read(&body, timeout, NULL);
    return message_view(size, body);
  }
  PyObject *read_pybuf_and_retry(float timeout) {
    void *body = NULL;
    size_t size = $self->read_and_retry(&body, timeout, NULL);
    return message_view(size, body);
  }

  // The header of the next message, a view into the transport's memory.
  Tarsel::IPC::MessageHeader_t *get_msg_header() {
    Tarsel::IPC::MessageHeader_t *header = NULL;
    return $self->try_read(NULL, &header) ? header : NULL;
  }

  PyObject *reserve_pybuf(size_t size, const char *const desc = NULL) {
    return reserved_view($self->reserve(size, desc), size);
  }
  PyObject *try_reserve_pybuf(size_t size, const char *const desc = NULL) {
    return reserved_view($self->try_reserve(size, desc), size);
  }
  PyObject *timed_reserve_pybuf(size_t size, float timeout, const char *const desc = NULL) {
    return reserved_view($self->timed_reserve(size, timeout, desc), size);
  }

  bool write_pybuf(PyObject *msg, const char *const desc = NULL) {
    MessageBytes bytes(msg, "write");
    return bytes.ok() && $self->write(bytes.data(), bytes.size(), desc);
  }
  bool try_write_pybuf(PyObject *msg, const char *const desc = NULL) {
    MessageBytes bytes(msg, "try_write");
    return bytes.ok() && $self->try_write(bytes.data(), bytes.size(), desc);
  }
  bool timed_write_pybuf(PyObject *msg, float timeout, const char *const desc = NULL) {
    MessageBytes bytes(msg, "timed_write");
    return bytes.ok() && $self->timed_write(bytes.data(), bytes.size(), timeout, desc);
  }
}

}
}

// Frees a transport at once; the proxy's ownership is left as it is.
void free_tarsel_ipc_shmemtransport(Tarsel::IPC::ShmemTransport *transport);
