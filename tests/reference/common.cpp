// What the oracle of Levels 2 and 3 consists of, as far as it depends on no element type: see common.h.
#include "tests/reference/common.h"

#include "tests/reference/sums.h"

namespace qtb::reference {
namespace {

// A number of the oracle that is a pair of doubles.
struct Scale {
  double re, im;
};
Scale as_doubles(QuadComplex v) { return {static_cast<double>(v.re), static_cast<double>(v.im)}; }
// Whether it is one, of which error-free products can be formed.
bool moderate(QuadComplex v) {
  const Scale d = as_doubles(v);
  return Quad(d.re) == v.re && Quad(d.im) == v.im && reference::moderate(d.re) && reference::moderate(d.im);
}
double magnitude_of(Scale v) { return std::fabs(v.re) + std::fabs(v.im); }

// A term made ready: rows of the left operand contiguous, with the range of each strip that is not structurally zero.
struct ReadyTerm {
  explicit ReadyTerm(const Term &term)
      : alpha(term.alpha),
        scale(as_doubles(term.alpha)),
        rows(op('T', term.left)),
        right(term.right),
        exact(term.left.single && term.right.single) {
    wide = !(moderate(alpha) && reference::moderate(rows.re) && reference::moderate(rows.im) &&
             reference::moderate(right.re) && reference::moderate(right.im));
    row_range = ranges(rows);
    column_range = ranges(right);
  }
  CompensatedSum sum(QtbInt i, QtbInt j) const {
    const Range k = range(i, j);
    return compensated_sum(k.first, k.last, row(i), column(j), rows.complex, exact);
  }
  WideSum sum_widely(QtbInt i, QtbInt j) const {
    const Range k = range(i, j);
    return wide_sum(k.first, k.last, row(i), column(j), rows.complex);
  }

  QuadComplex alpha;
  Scale scale;
  bool wide;  // needs the sum in 113 bits

 private:
  struct Range {
    QtbInt first, last;
  };
  static std::vector<Range> ranges(const Dense &d) {
    std::vector<Range> result;
    for (QtbInt j = 0; j < d.cols; ++j) {
      QtbInt first = 0, last = d.rows;
      while (last > 0 && d.has[d.at(last - 1, j)] == 0) --last;
      while (first < last && d.has[d.at(first, j)] == 0) ++first;
      result.push_back({first, last});
    }
    return result;
  }
  Range range(QtbInt i, QtbInt j) const {
    const auto r = row_range[static_cast<std::size_t>(i)], c = column_range[static_cast<std::size_t>(j)];
    return {std::max(r.first, c.first), std::min(r.last, c.last)};
  }
  Strip row(QtbInt i) const { return {rows.re.data() + rows.at(0, i), rows.im.data() + rows.at(0, i)}; }
  Strip column(QtbInt j) const { return {right.re.data() + right.at(0, j), right.im.data() + right.at(0, j)}; }

  Dense rows;
  const Dense &right;
  bool exact;
  std::vector<Range> row_range, column_range;
};

// The value of an element and the sum of the magnitudes of its summands, in compensated doubles.
struct Element {
  Compensated<double> re, im;
  double gauge = 0;

  void add(Scale scale, const CompensatedSum &sum, bool complex) {
    re.add_product(scale.re, sum.re);
    if (complex) {
      re.add_product(-scale.im, sum.im);
      im.add_product(scale.re, sum.im);
      im.add_product(scale.im, sum.re);
    }
    gauge += magnitude_of(scale) * sum.gauge;
  }
};

}  // namespace

Dense op(char trans, const Dense &a) {
  if (is_letter(trans, 'N')) return a;
  Dense d(a.cols, a.rows, a.complex, a.single);
  const double sign = is_letter(trans, 'C') ? -1 : 1;
  for (QtbInt j = 0; j < d.cols; ++j)
    for (QtbInt i = 0; i < d.rows; ++i) {
      const std::size_t to = d.at(i, j), from = a.at(j, i);
      d.re[to] = a.re[from];
      d.im[to] = sign * a.im[from];
      d.has[to] = a.has[from];
    }
  return d;
}

Expectation untouched(const Layout &layout) {
  Expectation e{layout, 0, 1, {}};
  e.element.resize(static_cast<std::size_t>(layout.rows * layout.cols));
  return e;
}

Expectation updated(const Layout &layout, const std::vector<Term> &terms, QuadComplex beta, const Dense *old,
                    bool complex, double roundings, Outcome outcome, bool hermitian) {
  Expectation e = untouched(layout);
  e.roundings = roundings;
  bool wide = old != nullptr && !moderate(beta);
  std::vector<ReadyTerm> ready;
  ready.reserve(terms.size());
  for (const Term &term : terms) {
    ready.emplace_back(term);
    wide = wide || ready.back().wide;
    e.alpha_magnitude = std::fmax(e.alpha_magnitude, static_cast<double>(magnitude(term.alpha)));
  }
  const Scale scale = as_doubles(beta);
  for (QtbInt j = 0; j < layout.cols; ++j)
    for (QtbInt i = 0; i < layout.rows; ++i) {
      if (!layout.stores(i, j)) continue;
      const bool real = hermitian && i == j;
      Expected &x = e.element[static_cast<std::size_t>(i + j * layout.rows)];
      x.outcome = real ? Outcome::real_value : outcome;
      Scale before{0, 0};
      if (old != nullptr) before = {old->re[old->at(i, j)], real ? 0 : old->im[old->at(i, j)]};
      if (!wide && reference::moderate(before.re) && reference::moderate(before.im)) {
        Element sum;
        for (const ReadyTerm &term : ready) sum.add(term.scale, term.sum(i, j), complex);
        if (old != nullptr) {
          CompensatedSum c;
          c.re.high = before.re, c.im.high = before.im, c.gauge = magnitude_of(before);
          sum.add(scale, c, complex);
        }
        x.value.re = sum.re.value();
        if (complex && !real) x.value.im = sum.im.value();
        x.gauge = sum.gauge;
        continue;
      }
      for (const ReadyTerm &term : ready) {
        const WideSum sum = term.sum_widely(i, j);
        const QuadComplex p = product(term.alpha, sum.value, complex);
        x.value.re += p.re;
        x.value.im += p.im;
        x.gauge += static_cast<double>(magnitude(term.alpha)) * sum.gauge;
      }
      if (old != nullptr) {
        const QuadComplex was{Quad(before.re), Quad(before.im)}, p = product(beta, was, complex);
        x.value.re += p.re;
        x.value.im += p.im;
        x.gauge += static_cast<double>(magnitude(beta) * magnitude(was));
      }
      if (real) x.value.im = 0;
    }
  return e;
}

}  // namespace qtb::reference
