#pragma once
// The element types of the vector library: complex numbers stored as two values, real part
// first, so that an array of them can be read as interleaved pairs. Used by every unit of
// analysis/vector and by the analysis and resynthesis that call it.

struct fComplex {
    float Re;    // real part
    float Im;    // imaginary part
};

struct dComplex {
    double Re;   // real part
    double Im;   // imaginary part
};
