// Iterators of the containers (SwigPyIterator). SWIG's own hold a bare C++
// iterator: one used after its container changed, one of another container,
// one moved past either end, or one whose container was freed, reads or
// writes freed memory. These positions never do:
//
// - A position holds its container's Python object, so the container lives
//   as long as it does, and finds the container through it on every use (a
//   vector lent to a drawing call is gone once the call returns).
// - It remembers the container's size when it was made: while the size
//   differs from that, every use of it raises RuntimeError.
// - A vector position is an index, a map position the key it stands at, so no
//   use can reach outside the container: moving before the first element or
//   past the end raises StopIteration, reading at the end too.
// - erase and insert take only a position of the very container they are
//   called on, that a change has not made stale, within their range.
//
// The messages that SWIG's iterators give stay as they are ("bad iterator
// type", StopIteration at the ends, the argument messages of erase and
// insert).

// `iterator + n` and `iterator - n` free the copy they make when the step
// runs past either end (StopIteration) instead of dropping it; comparing
// iterators of different kinds or containers gives False, and subtracting
// one from the other fails, instead of throwing out of the wrapper ("bad
// iterator type" is equal()'s and distance()'s to raise; Python turns a
// failed operator into TypeError).
%feature("action") swig::SwigPyIterator::operator+(ptrdiff_t n) const {
  std::unique_ptr<swig::SwigPyIterator> copy(arg1->copy());
  copy->advance(arg2);
  result = copy.release();
}
%feature("action") swig::SwigPyIterator::operator-(ptrdiff_t n) const {
  std::unique_ptr<swig::SwigPyIterator> copy(arg1->copy());
  copy->advance(-arg2);
  result = copy.release();
}
%feature("action") swig::SwigPyIterator::operator-(const SwigPyIterator &x) const {
  try {
    result = *arg1 - *arg2;
  } catch (const std::invalid_argument &refused) {
    PyErr_SetString(PyExc_ValueError, refused.what());
    SWIG_fail;
  }
}
%feature("action") swig::SwigPyIterator::operator==(const SwigPyIterator &x) const {
  try {
    result = arg1->equal(*arg2);
  } catch (const std::invalid_argument &) {
    result = false;
  }
}
%feature("action") swig::SwigPyIterator::operator!=(const SwigPyIterator &x) const {
  try {
    result = !arg1->equal(*arg2);
  } catch (const std::invalid_argument &) {
    result = true;
  }
}

%include <pycontainer.swg>

%fragment("ContainerPositions", "header", fragment="SwigPyIterator_T", fragment="StdMapCommonTraits") %{
#include <memory>
#include <string>

namespace swig {

typedef RefusedCall PositionRefused;

// What a position shares, whatever its container: the container's Python
// object and the size it had. The container is found through the pointer
// object inside the Python object, held from the start: a lent vector's is
// cut off (its pointer nulled) when the lending call returns.
template <class Container, class OutIter>
class ContainerPosition : public SwigPyIterator_T<OutIter> {
public:
  ContainerPosition(Container *container, const OutIter &at, PyObject *seq)
      : SwigPyIterator_T<OutIter>(at, seq), seq_(seq), pointer_object_(pointer_object(container, seq)),
        size_(container->size())
  {
  }

  // The container, alive and unchanged in size; else it refuses.
  Container *container() const
  {
    Container *container = current();
    if (!container)
      throw PositionRefused{PyExc_ValueError, "the iterator's " + kind() + " no longer exists"};
    if (container->size() != size_)
      throw PositionRefused{PyExc_RuntimeError, kind() + " changed size since the iterator was made"};
    return container;
  }
  // Whether `container` is the one this position belongs to. A position
  // without a container (made by a foreign module) belongs to none.
  bool belongs_to(const Container *container) const { return container && current() == container; }
  // Refuses a position given to another container than its own, or one a
  // change of its container made stale.
  void check_given_to(const Container *container) const
  {
    if (!belongs_to(container))
      throw PositionRefused{PyExc_ValueError, "an iterator of another container"};
    this->container();
  }
  // The same kind of position over the same container, or "bad iterator type".
  template <class Position>
  static const Position &alike(const Position &self, const SwigPyIterator &other)
  {
    const Position *position = dynamic_cast<const Position *>(&other);
    if (!position)
      throw std::invalid_argument("bad iterator type");
    if (!position->belongs_to(self.container()))
      throw std::invalid_argument("iterators of different containers");
    return *position;
  }

protected:
  std::string kind() const { return seq_ ? Py_TYPE(seq_)->tp_name : "container"; }

private:
  // The pointer object of `seq` when it stands for `container`, else none.
  static PyObject *pointer_object(Container *container, PyObject *seq)
  {
    void *pointer = 0;
    if (!seq || !SWIG_IsOK(SWIG_ConvertPtr(seq, &pointer, swig::type_info<Container>(), 0)) || pointer != container)
      return 0;
    return (PyObject *)SWIG_Python_GetSwigThis(seq);
  }
  Container *current() const
  {
    PyObject *object = pointer_object_;
    return object ? static_cast<Container *>(((SwigPyObject *)object)->ptr) : 0;
  }

  PyObject *seq_;                    // held by SwigPyIterator
  SwigPtr_PyObject pointer_object_;  // held here
  typename Container::size_type size_;
};

// A position in a vector: an index, from the first element forwards or from
// the last backwards.
template <class Vector, class OutIter, bool Reversed>
class VectorPosition : public ContainerPosition<Vector, OutIter> {
  typedef ContainerPosition<Vector, OutIter> base;
  typedef VectorPosition<Vector, OutIter, Reversed> self_type;

public:
  VectorPosition(Vector *vector, size_t index, PyObject *seq) : base(vector, start(vector) + index, seq), index_(index)
  {
  }

  PyObject *value() const
  {
    Vector *vector = base::container();
    if (index_ >= vector->size())
      throw stop_iteration();
    return swig::from(static_cast<const typename Vector::value_type &>(*(start(vector) + index_)));
  }
  SwigPyIterator *incr(size_t n = 1)
  {
    if (n > base::container()->size() - index_)
      throw stop_iteration();
    index_ += n;
    return this;
  }
  SwigPyIterator *decr(size_t n = 1)
  {
    base::container();
    if (n > index_)
      throw stop_iteration();
    index_ -= n;
    return this;
  }
  ptrdiff_t distance(const SwigPyIterator &other) const
  {
    return ptrdiff_t(base::alike(*this, other).index_) - ptrdiff_t(index_);
  }
  bool equal(const SwigPyIterator &other) const { return base::alike(*this, other).index_ == index_; }
  SwigPyIterator *copy() const { return new self_type(*this); }

  // The C++ iterator in `vector`, checked for `use`: 0 any position from the
  // first to the end, 1 an element.
  OutIter at(Vector *vector, int use) const
  {
    base::check_given_to(vector);
    if (index_ + use > vector->size())
      throw PositionRefused{PyExc_IndexError, "the iterator is past the last element"};
    return start(vector) + index_;
  }

private:
  static OutIter start(Vector *vector) { return begin_of(vector, (OutIter *)0); }
  static typename Vector::iterator begin_of(Vector *vector, typename Vector::iterator *) { return vector->begin(); }
  static typename Vector::reverse_iterator begin_of(Vector *vector, typename Vector::reverse_iterator *)
  {
    return vector->rbegin();
  }
  size_t index_;
};

// A position in a map: the key it stands at (none at the end), walking the
// keys upwards or, reversed, downwards.
template <class Map, class OutIter, class FromOper, bool Reversed>
class MapPosition : public ContainerPosition<Map, OutIter> {
  typedef ContainerPosition<Map, OutIter> base;
  typedef MapPosition<Map, OutIter, FromOper, Reversed> self_type;
  typedef typename Map::key_type key_type;
  typedef typename Map::iterator iterator;

public:
  MapPosition(Map *map, const OutIter &at, PyObject *seq) : base(map, at, seq), at_end_(at == finish(map))
  {
    if (!at_end_)
      key_.reset(new key_type(at->first));
  }
  MapPosition(const MapPosition &other)
      : base(other), at_end_(other.at_end_), key_(other.key_ ? new key_type(*other.key_) : 0)
  {
  }

  PyObject *value() const
  {
    Map *map = base::container();
    if (at_end_)
      throw stop_iteration();
    return from(static_cast<const typename Map::value_type &>(*element(map)));
  }
  SwigPyIterator *incr(size_t n = 1)
  {
    Map *map = base::container();
    while (n--) {
      if (at_end_)
        throw stop_iteration();
      iterator here = element(map);
      if (Reversed)
        move(map, here == map->begin() ? map->end() : --here);  // the end of a downward walk
      else
        move(map, ++here);
    }
    return this;
  }
  SwigPyIterator *decr(size_t n = 1)
  {
    Map *map = base::container();
    while (n--) {
      iterator to;
      if (Reversed) {  // back up the keys
        if (at_end_) {
          if (map->empty())
            throw stop_iteration();
          to = map->begin();
        } else if ((to = ++element(map)) == map->end()) {
          throw stop_iteration();
        }
      } else {  // back down the keys
        to = at_end_ ? map->end() : element(map);
        if (to == map->begin())
          throw stop_iteration();
        --to;
      }
      move(map, to);
    }
    return this;
  }
  ptrdiff_t distance(const SwigPyIterator &other) const
  {
    const self_type &to = base::alike(*this, other);
    Map *map = base::container();
    return to.order(map) - order(map);
  }
  bool equal(const SwigPyIterator &other) const
  {
    const self_type &to = base::alike(*this, other);
    return to.at_end_ == at_end_ && (at_end_ || !(*to.key_ < *key_ || *key_ < *to.key_));
  }
  SwigPyIterator *copy() const { return new self_type(*this); }

  iterator at(Map *map, int use) const
  {
    base::check_given_to(map);
    if (at_end_ && use)
      throw PositionRefused{PyExc_IndexError, "the iterator is past the last element"};
    return at_end_ ? map->end() : element(map);
  }

private:
  static OutIter finish(Map *map) { return end_of(map, (OutIter *)0); }
  static iterator end_of(Map *map, iterator *) { return map->end(); }
  static typename Map::reverse_iterator end_of(Map *map, typename Map::reverse_iterator *) { return map->rend(); }

  // The element at the key; its key may have gone (erased and another put in
  // its place, the size the same).
  iterator element(Map *map) const
  {
    iterator found = map->find(*key_);
    if (found == map->end())
      throw PositionRefused{PyExc_RuntimeError, base::kind() + " changed since the iterator was made"};
    return found;
  }
  void move(Map *map, iterator to)
  {
    at_end_ = to == map->end();
    key_.reset(at_end_ ? 0 : new key_type(to->first));
  }
  // Steps from the start of the walk.
  ptrdiff_t order(Map *map) const
  {
    const ptrdiff_t from_begin = at_end_ ? ptrdiff_t(map->size()) : std::distance(map->begin(), element(map));
    return Reversed ? (at_end_ ? ptrdiff_t(map->size()) : ptrdiff_t(map->size()) - 1 - from_begin) : from_begin;
  }

  FromOper from;
  bool at_end_;
  std::unique_ptr<key_type> key_;
};

// A position for each kind of container and iterator the module has.
template <class T, class A>
SwigPyIterator *container_position(std::vector<T, A> *vector, const typename std::vector<T, A>::iterator &at,
                                   PyObject *seq)
{
  typedef std::vector<T, A> Vector;
  return new VectorPosition<Vector, typename Vector::iterator, false>(vector, size_t(at - vector->begin()), seq);
}
template <class T, class A>
SwigPyIterator *container_position(std::vector<T, A> *vector, const typename std::vector<T, A>::reverse_iterator &at,
                                   PyObject *seq)
{
  typedef std::vector<T, A> Vector;
  return new VectorPosition<Vector, typename Vector::reverse_iterator, true>(vector, size_t(at - vector->rbegin()),
                                                                             seq);
}
template <class K, class T, class C, class A>
SwigPyIterator *container_position(std::map<K, T, C, A> *map, const typename std::map<K, T, C, A>::iterator &at,
                                   PyObject *seq)
{
  typedef std::map<K, T, C, A> Map;
  return new MapPosition<Map, typename Map::iterator, from_oper<typename Map::value_type>, false>(map, at, seq);
}
template <class K, class T, class C, class A>
SwigPyIterator *container_position(std::map<K, T, C, A> *map, const typename std::map<K, T, C, A>::reverse_iterator &at,
                                   PyObject *seq)
{
  typedef std::map<K, T, C, A> Map;
  return new MapPosition<Map, typename Map::reverse_iterator, from_oper<typename Map::value_type>, true>(map, at, seq);
}

// A position in the map `seq` stands for, reading each element with FromOper.
template <class Map, template <class> class FromOper>
SwigPyIterator *map_position(const typename Map::iterator &at, PyObject *seq)
{
  void *map = 0;
  SWIG_ConvertPtr(seq, &map, swig::type_info<Map>(), 0);
  return new MapPosition<Map, typename Map::iterator, FromOper<typename Map::value_type>, false>(
      static_cast<Map *>(map), at, seq);
}

// The C++ iterator an iterator argument of `container` stands for, checked
// for `use` (0 any position, 1 an element); false with the reason set when
// it is refused, or when it is no position of this module (`refused.type`
// is then null).
template <class Position, class Container, class OutIter>
bool position_of(Container *container, SwigPyIterator *iterator, int use, OutIter *out, PositionRefused *refused)
{
  refused->type = 0;
  const Position *position = dynamic_cast<const Position *>(iterator);
  if (!position)
    return false;
  try {
    *out = position->at(container, use);
    return true;
  } catch (const PositionRefused &why) {
    *refused = why;
    return false;
  }
}
template <class Container, class OutIter>
bool position_argument(Container *container, SwigPyIterator *iterator, int use, OutIter *out, PositionRefused *refused)
{
  return position_of<VectorPosition<Container, OutIter, false> >(container, iterator, use, out, refused);
}
template <class K, class T, class C, class A>
bool position_argument(std::map<K, T, C, A> *map, SwigPyIterator *iterator, int use,
                       typename std::map<K, T, C, A>::iterator *out, PositionRefused *refused)
{
  typedef std::map<K, T, C, A> Map;
  return position_of<MapPosition<Map, typename Map::iterator, from_oper<typename Map::value_type>, false> >(
      map, iterator, use, out, refused);
}

}  // namespace swig
%}

// The key and value iterators of the map MAP (key_iterator, value_iterator,
// and Python's iteration over its keys), as positions: overloads of SWIG's
// makers for MAP's own iterator type, which the compiler prefers. NAME names
// the map's type here.
%define %map_key_and_value_positions(NAME, MAP...)
%fragment("ContainerPositions");
%{
namespace swig {
typedef MAP NAME;
inline SwigPyIterator *make_output_key_iterator(const NAME::iterator &at, const NAME::iterator &,
                                                const NAME::iterator &, PyObject *seq) {
  return map_position<NAME, from_key_oper>(at, seq);
}
inline SwigPyIterator *make_output_value_iterator(const NAME::iterator &at, const NAME::iterator &,
                                                  const NAME::iterator &, PyObject *seq) {
  return map_position<NAME, from_value_oper>(at, seq);
}
}
%}
%enddef

// SWIG's macro for the iterators of a container, made again with positions:
// results of iterator type become positions of the container the method was
// called on (arg1, its Python object swig_obj[0]); iterator arguments are
// checked against it.
#undef %swig_sequence_iterator_with_making_function
%define %swig_sequence_iterator_with_making_function(Make_output_iterator, Sequence...)
  class iterator;
  class reverse_iterator;
  class const_iterator;
  class const_reverse_iterator;

  %fragment("ContainerPositions");

  %typemap(out, noblock=1) iterator, reverse_iterator {
    $result = SWIG_NewPointerObj(swig::container_position(arg1, $1, swig_obj[0]), swig::SwigPyIterator::descriptor(),
                                 SWIG_POINTER_OWN);
  }

  // pos: insert takes any position from the first element to the end; erase
  // an element, as position (a map's erase) does. first and last: any
  // position, first not after last.
  %typemap(in, noblock=1) iterator pos (swig::SwigPyIterator *iter = 0, int res = 0),
                          iterator position (swig::SwigPyIterator *iter = 0, int res = 0),
                          iterator first (swig::SwigPyIterator *iter = 0, int res = 0),
                          iterator last (swig::SwigPyIterator *iter = 0, int res = 0) {
    res = SWIG_ConvertPtr($input, %as_voidptrptr(&iter), swig::SwigPyIterator::descriptor(), 0);
    {
      swig::PositionRefused refused;
      const int use = ("$1_name"[0] == 'p' && std::strstr("$symname", "_erase")) ? 1 : 0;
      if (!SWIG_IsOK(res) || !iter || !swig::position_argument(arg1, iter, use, &$1, &refused)) {
        if (!refused.type) {
          %argument_fail(SWIG_TypeError, "$type", $symname, $argnum);
        }
        PyErr_Format(refused.type, "in method '$symname', argument $argnum of type '$type': %s", refused.message.c_str());
        SWIG_fail;
      }
    }
  }
  %typemap(check, noblock=1) (iterator first, iterator last) {
    if (std::distance(arg1->begin(), $1) > std::distance(arg1->begin(), $2)) {
      PyErr_SetString(PyExc_IndexError, "in method '$symname': the first iterator is after the last");
      SWIG_fail;
    }
  }

  %typecheck(%checkcode(ITERATOR), noblock=1) iterator, reverse_iterator, const_iterator, const_reverse_iterator {
    swig::SwigPyIterator *iter = 0;
    int res = SWIG_ConvertPtr($input, %as_voidptrptr(&iter), swig::SwigPyIterator::descriptor(), 0);
    $1 = (SWIG_IsOK(res) && iter && (dynamic_cast<swig::SwigPyIterator_T<$type > *>(iter) != 0));
  }

  %newobject iterator(PyObject **PYTHON_SELF);
  %extend {
    swig::SwigPyIterator *iterator(PyObject **PYTHON_SELF) {
      return swig::container_position(self, self->begin(), *PYTHON_SELF);
    }
    %pythoncode %{def __iter__(self):
    return self.iterator()%}
  }
%enddef

%{
#include <cstring>
#include <memory>
%}
