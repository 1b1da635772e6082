#pragma once

#include <pybind11/pybind11.h>

#include "hosts/embedded/Value.hpp"

// Values of Python as values of the host, and back. All functions need the
// interpreter's lock and are linear in the elements; those that walk many
// elements let Python handle signals, so that Ctrl-C ends them.
namespace tessel::python {

// The host's value of a Python value:
//
//   str                             char, 1 x n, in UTF-16
//   bool                            logical, 1 x 1
//   int, float                      double, 1 x 1
//   bytes, bytearray                uint8, n x 1
//   list, tuple                     cell, n x 1
//   array of object or str          cell, n x 1
//   array of uint8; of bool         uint8, n x 1; logical, n x 1
//   array of other integers, float  double, n x 1
//   dict with keys of str           struct, 1 x 1
//   None                            double, 0 x 0: an element that is not set
//
// The elements of an array of several dimensions are taken in column-major
// order. A scalar of NumPy and a memoryview are taken as their arrays.
// Raises TypeError for anything else.
embedded::Value toValue(pybind11::handle object);

// The Python value of the host's:
//
//   char              str
//   logical           bool, of the first element
//   double, uint8     array of float64, of uint8, with one dimension
//   double, 0 x 0     None
//   cell              list
//   struct            dict, of the first element
//
// Elements come in column-major order. Surrogates that are no pair are kept in
// a str.
pybind11::object toObject(const embedded::Value& value);

}  // namespace tessel::python
