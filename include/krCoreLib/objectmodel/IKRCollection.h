// IKRReadOnlyCollection, IKRCollection and IKRIterator: the abstract views
// of the object containers, so that fields, storage back-ends and the plug-in
// manager can walk and fill any collection without knowing its kind.
//
// Collections hold plain pointers and never destroy an element except when
// RemoveAll(true) asks each element to Release() itself.
#pragma once

#include <krCoreLib/objectmodel/IKRObject.h>

#include <type_traits>

class KRCORELIB_API IKRReadOnlyCollection {
public:
  virtual int GetCount() const = 0;
  // The element with instance ID `instanceID`, or null.
  virtual IKRObject* Find(CKRGuid instanceID) = 0;

protected:
  ~IKRReadOnlyCollection() = default;
};

class KRCORELIB_API IKRCollection : public IKRReadOnlyCollection {
public:
  // Empties the collection; with `release`, releases the elements as well.
  virtual void RemoveAll(bool release) = 0;
  // 1 when added; 0 for null, for an element of the wrong class and for an
  // element the collection refuses (already present).
  virtual int Add(IKRObject* element) = 0;
  // The removed element, or null when it is not in the collection.
  virtual IKRObject* Remove(IKRObject* element) = 0;

protected:
  ~IKRCollection() = default;

  // `element` as the collection's element class T, or null when it is not
  // one (the views take any object; a collection holds only its class).
  template <class T>
  static T* CastElement(IKRObject* element) {
    if constexpr (std::is_same_v<T, IKRObject>)
      return element;
    else
      return dynamic_cast<T*>(element);
  }
};

// A forward walk over a collection: call Next(1) once, then Next(0) until it
// returns null. An iterator does not survive the removal of the element at
// its position, nor the end of its collection.
class KRCORELIB_API IKRIterator {
public:
  // With `restart` nonzero, first moves to the first element. Returns the
  // element at the position and advances, or null at the end and for an
  // unbound iterator.
  virtual IKRObject* Next(int restart) = 0;
  // With `reset` nonzero and a bound iterator, moves to the first element.
  virtual void Reset(int reset) = 0;
  // True when the iterator is bound to a collection.
  virtual bool IsValid() const = 0;

protected:
  ~IKRIterator() = default;
};
