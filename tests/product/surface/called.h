// A call of one shape on a problem: its arrays in guarded memory, filled as far as the call may read them, and its
// arguments.
#pragma once

#include <cstddef>
#include <optional>

#include "calls/level1.h"
#include "calls/level3.h"
#include "tests/product/surface/session.h"

namespace qtb::surface {

using calls::Description;
using calls::Form;

// An array of the call; none where the shape has none.
template <class T>
class Array {
 public:
  Array(const Form &form, Draw &draw) : form_(form) {
    if (form.is_argument) operand_.emplace(form.layout, draw);
  }

  // Inputs are unreadable, and results full of NaNs, where the call must not read them.
  void prepare(const Problem &p, Draw &draw) {
    if (!operand_) return;
    if (form_.is_read) operand_->fill(form_.structure, p.values, draw);
    operand_->seal(form_.is_written ? Access::write : form_.is_read ? Access::read : Access::none);
  }
  T *data() { return operand_ ? operand_->data() : nullptr; }
  const T *before() const { return operand_->before(); }
  const T *after() const { return operand_->after(); }
  const Layout &layout() const { return form_.layout; }
  Operand<T> &operand() { return *operand_; }
  const Operand<T> &operand() const { return *operand_; }

 private:
  Form form_;
  std::optional<Operand<T>> operand_;
};

template <ShapeName shape, class T>
class Called {
 public:
  Called(const Problem &p, const calls::Kind &kind)
      : draw_(p.seed),
        description_(calls::describe<shape>(p, kind)),
        a(description_.a, draw_),
        b(description_.b, draw_),
        c(description_.c, draw_),
        x(description_.x, draw_),
        y(description_.y, draw_),
        scalars(description_) {
    for (Array<T> *array : {&a, &b, &c, &x, &y}) array->prepare(p, draw_);
  }

  // As the shape has it: a factor is real, the letter for trans is legal.
  const Problem &problem() const { return description_.problem; }

  template <class R>
  decltype(auto) call(Session &s, const R &routine) {
    const Inputs inputs(*this, s);
    const typename Shape<shape>::Call call(
        scalars.template arguments<shape>(a.data(), b.data(), c.data(), x.data(), y.data(), problem().index));
    return s.call(routine, call);
  }

 private:
  // Sees that what the scalar arguments point to stays, but for what the shape has as a result.
  struct Inputs {
    Inputs(const Called &of, Session &of_session) : called(of), session(of_session) {
      std::memcpy(before, static_cast<const void *>(&called.scalars), size());
    }
    ~Inputs() {
      session.require(std::memcmp(before, static_cast<const void *>(&called.scalars), size()) == 0, "wrote an input");
    }
    std::size_t size() const {
      const auto &s = called.scalars;
      const void *end = Shape<shape>::changes_scalars ? &s.alpha : &s.result;
      return static_cast<std::size_t>(static_cast<const char *>(end) -
                                      static_cast<const char *>(static_cast<const void *>(&s)));
    }
    const Called &called;
    Session &session;
    unsigned char before[sizeof(calls::Scalars<T>)];
  };

  Draw draw_;
  Description description_;

 public:
  Array<T> a, b, c, x, y;
  calls::Scalars<T> scalars;
};

}  // namespace qtb::surface
