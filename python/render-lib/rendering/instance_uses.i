// Effect instances in use. The module records every instance it hands out
// (init_tarsel_effect, init_tarsel_effect_from_string) until the engine has
// freed it, and every wrapper that passes an instance to the engine, or reads
// it, holds a use of it for its whole length. Freeing an instance that is in
// use (from another thread, or from a callback of the very call that uses it)
// only marks it freed; the last use frees it in the engine.
//
// A freed instance is refused wherever it is passed. The proxy it was freed
// through is marked as well: its address may be handed out again for a new
// instance, and the old proxy must not reach that one. Everything here runs
// with the interpreter lock held, which guards both records.

%{
#include <unordered_map>
#include <unordered_set>
#include "tarsel/effect.h"

struct InstanceRecord {
  unsigned long long serial;  // tells a record from a later one at the same address
  int uses;
  bool freed;  // free_tarsel_effect or the owning proxy's end came while in use
};

class InstanceRecords {
public:
  // A new instance and the pointer object of its proxy (which may sit where a
  // freed proxy's did).
  void handed_out(EffectGlobals_t *instance, const void *proxy)
  {
    InstanceRecord &record = records_[instance];
    record.serial = ++serials_;
    record.uses = 0;
    record.freed = false;
    freed_proxies_.erase(proxy);
  }
  // The live record of `instance` reached through `proxy` (null for a bare
  // address), or null.
  InstanceRecord *live(EffectGlobals_t *instance, const void *proxy)
  {
    auto found = records_.find(instance);
    if (found == records_.end() || found->second.freed || (proxy && freed_proxies_.count(proxy)))
      return NULL;
    return &found->second;
  }
  InstanceRecord *find(EffectGlobals_t *instance, unsigned long long serial)
  {
    auto found = records_.find(instance);
    return found == records_.end() || found->second.serial != serial ? NULL : &found->second;
  }
  void forget(EffectGlobals_t *instance) { records_.erase(instance); }
  void proxy_freed(const void *proxy)
  {
    if (proxy)
      freed_proxies_.insert(proxy);
  }
private:
  std::unordered_map<EffectGlobals_t *, InstanceRecord> records_;
  // Pointer objects of proxies an instance was freed through, until another
  // instance's proxy takes the same place.
  std::unordered_set<const void *> freed_proxies_;
  unsigned long long serials_ = 0;
};
static InstanceRecords &instance_records()
{
  static InstanceRecords *records = new InstanceRecords;  // proxies may outlive module teardown
  return *records;
}

// The engine's free, without the interpreter lock. From a use that ends, an
// engine abort has no call left to report it to.
static void free_in_engine(EffectGlobals_t *instance, bool report_abort)
{
  ThreadAllowed released;
  try {
    free_tarsel_effect(instance);
  } catch (const TarselAbortException &) {
    if (report_abort)
      throw;
  }
}

// One wrapper's use of an instance, from its argument check to its return.
class InstanceUse {
public:
  InstanceUse() : instance_(NULL), proxy_(NULL), serial_(0) {}
  ~InstanceUse()
  {
    InstanceRecord *record = instance_ ? instance_records().find(instance_, serial_) : NULL;
    if (!record || --record->uses > 0 || !record->freed)
      return;
    instance_records().forget(instance_);
    free_in_engine(instance_, false);
  }
  // False for an instance the module did not hand out or that is freed, and
  // for a proxy an instance was freed through.
  bool enter(EffectGlobals_t *instance, const void *proxy)
  {
    InstanceRecord *record = instance_records().live(instance, proxy);
    if (!record)
      return false;
    ++record->uses;
    instance_ = instance;
    proxy_ = proxy;
    serial_ = record->serial;
    return true;
  }
  // Frees the instance this use holds: at once when no other call uses it,
  // otherwise when the last one returns. This use is given back here.
  void free_instance()
  {
    InstanceRecord *record = instance_ ? instance_records().find(instance_, serial_) : NULL;
    if (!record)
      return;
    EffectGlobals_t *instance = instance_;
    const void *proxy = proxy_;
    instance_ = NULL;
    instance_records().proxy_freed(proxy);
    if (--record->uses > 0) {
      record->freed = true;  // the last use frees
      return;
    }
    instance_records().forget(instance);
    try {
      free_in_engine(instance, true);
    } catch (const TarselAbortException &) {
      instance_records().handed_out(instance, proxy);  // not freed: the host may try again
      throw;
    }
  }
  InstanceUse(const InstanceUse &) = delete;
  InstanceUse &operator=(const InstanceUse &) = delete;
private:
  EffectGlobals_t *instance_;
  const void *proxy_;
  unsigned long long serial_;
};
%}

// EffectGlobals_t *
// An instance argument: converted as SWIG does, remembering the pointer
// object it came through, and held for the call; a freed instance is refused
// with ValueError. None passes as null to a function, and is refused as the
// object of a method. The identity methods (comparison, hash, repr) read no
// engine memory and take a freed instance too.
%typemap(in, noblock=1) EffectGlobals_t * (void *argp = 0, int res = 0, SwigPyObject *proxy = 0) {
  res = SWIG_ConvertPtr($input, &argp, $descriptor, $disown | %convertptr_flags);
  if (!SWIG_IsOK(res)) {
    %argument_fail(res, "$type", $symname, $argnum);
  }
  $1 = %reinterpret_cast(argp, $ltype);
  proxy = $input == Py_None ? NULL : SWIG_Python_GetSwigThis($input);
}
%typemap(check, noblock=1) EffectGlobals_t *self (InstanceUse use) {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError,
                        "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
  if (!use.enter($1, proxy$argnum))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "no effect instance (freed by free_tarsel_effect)");
}
%typemap(check, noblock=1) EffectGlobals_t const *self {
  (void)proxy$argnum;
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError,
                        "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
}
%typemap(check, noblock=1) EffectGlobals_t * (InstanceUse use) {
  if ($1 && !use.enter($1, proxy$argnum))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "no effect instance (freed by free_tarsel_effect)");
}

// EffectGlobals_t * (a result): recorded as handed out.
%typemap(ret, noblock=1) EffectGlobals_t * {
  if ($1)
    instance_records().handed_out($1, SWIG_Python_GetSwigThis($result));
}
