// Conventions shared by the descriptor classes.

// %record_identity(TYPE): engine records compare by identity, not contents.
// Two proxies are equal exactly when they hold the same native address, and
// the hash is the low 32 bits of that address as a signed int. An operand that
// does not convert (another type, None, a null proxy) gives NotImplemented,
// so Python falls back to its own comparison instead of raising.
%define %record_identity(TYPE)
%pythonmaybecall TYPE::__eq__;
%pythonmaybecall TYPE::__ne__;
%extend TYPE {
  bool __eq__(const TYPE &other) const { return $self == &other; }
  bool __ne__(const TYPE &other) const { return $self != &other; }
  int __hash__() const { return static_cast<int>(static_cast<uint32_t>(reinterpret_cast<uintptr_t>($self))); }
}
%enddef
