// Effect instances in use. The module records every instance it hands out
// (init_tarsel_effect, init_tarsel_effect_from_string) until the engine has
// freed it, and every wrapper that passes an instance to the engine, or reads
// it, holds a use of it for its whole length. Freeing an instance that is in
// use (from another thread, or from a callback of the very call that uses it)
// only marks it freed; the last use frees it in the engine. A freed instance
// is refused wherever it is passed, instead of followed into freed memory.
// Everything here runs with the interpreter lock held, which guards the
// record.

%{
#include <unordered_map>
#include "tarsel/effect.h"

struct InstanceRecord {
  unsigned long long serial;  // tells a record from a later one at the same address
  int uses;
  bool freed;  // free_tarsel_effect or the owning proxy's end came while in use
};

class InstanceRecords {
public:
  void handed_out(EffectGlobals_t *instance)
  {
    InstanceRecord &record = records_[instance];
    record.serial = ++serials_;
    record.uses = 0;
    record.freed = false;
  }
  // The live record of `instance`, or null.
  InstanceRecord *live(EffectGlobals_t *instance)
  {
    auto found = records_.find(instance);
    return found == records_.end() || found->second.freed ? NULL : &found->second;
  }
  InstanceRecord *find(EffectGlobals_t *instance, unsigned long long serial)
  {
    auto found = records_.find(instance);
    return found == records_.end() || found->second.serial != serial ? NULL : &found->second;
  }
  void forget(EffectGlobals_t *instance) { records_.erase(instance); }
private:
  std::unordered_map<EffectGlobals_t *, InstanceRecord> records_;
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
  InstanceUse() : instance_(NULL), serial_(0) {}
  ~InstanceUse()
  {
    InstanceRecord *record = instance_ ? instance_records().find(instance_, serial_) : NULL;
    if (!record || --record->uses > 0 || !record->freed)
      return;
    instance_records().forget(instance_);
    free_in_engine(instance_, false);
  }
  // False for an instance the module did not hand out or that is freed.
  bool enter(EffectGlobals_t *instance)
  {
    InstanceRecord *record = instance_records().live(instance);
    if (!record)
      return false;
    ++record->uses;
    instance_ = instance;
    serial_ = record->serial;
    return true;
  }
  InstanceUse(const InstanceUse &) = delete;
  InstanceUse &operator=(const InstanceUse &) = delete;
private:
  EffectGlobals_t *instance_;
  unsigned long long serial_;
};

// Frees an instance the caller holds one use of: at once when no other call
// uses it, otherwise when the last one returns. The caller's own use is
// given back here.
static void free_effect_instance(EffectGlobals_t *instance)
{
  InstanceRecord *record = instance_records().live(instance);
  if (!record)
    return;
  if (record->uses > 1) {
    record->freed = true;
    return;  // the caller's use ends with its wrapper; the last use frees
  }
  instance_records().forget(instance);  // the caller's use finds no record and does nothing
  try {
    free_in_engine(instance, true);
  } catch (const TarselAbortException &) {
    instance_records().handed_out(instance);  // not freed: the host may try again
    throw;
  }
}
%}

// EffectGlobals_t *self, EffectGlobals_t *
// An instance passed to a method (None refused) or to a function (None passes
// as null): held for the call; a freed instance is refused with ValueError.
%typemap(check, noblock=1) EffectGlobals_t *self (InstanceUse use) {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError, "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
  if (!use.enter($1))
    SWIG_exception_fail(SWIG_ValueError, "in method '$symname', argument $argnum of type '$1_type': "
                        "no effect instance (freed by free_tarsel_effect)");
}
// EffectGlobals_t const *self
// The identity methods (comparison, hash, repr) read no engine memory: they
// work on a freed instance too.
%typemap(check, noblock=1) EffectGlobals_t const *self {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError, "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
}
%typemap(check, noblock=1) EffectGlobals_t * (InstanceUse use) {
  if ($1 && !use.enter($1))
    SWIG_exception_fail(SWIG_ValueError, "in method '$symname', argument $argnum of type '$1_type': "
                        "no effect instance (freed by free_tarsel_effect)");
}

// EffectGlobals_t * (a result): recorded as handed out.
%typemap(ret, noblock=1) EffectGlobals_t * {
  if ($1)
    instance_records().handed_out($1);
}
