# NaN, NA and infinities go through products as through sums of products, whichever way R forms a product; and residuals
# of products, rank-k updates and triangular solves. Prints "failed NAME" for each failure, "count N" at the end.
count <- 0
check <- function(name, holds) {
  count <<- count + 1
  if (!isTRUE(holds)) cat("failed ", name, "\n", sep = "")
}
# The product as its definition has it.
plain <- function(x, y) {
  z <- matrix(x[1, 1] * y[1, 1], nrow(x), ncol(y))
  for (i in seq_len(nrow(x))) for (j in seq_len(ncol(y))) z[i, j] <- sum(x[i, ] * y[, j])
  z
}
kind <- function(x) ifelse(is.nan(x) | is.na(x), "nan", ifelse(is.finite(x), "finite", ifelse(x > 0, "+inf", "-inf")))
bound <- function(k) 4 * k * .Machine$double.eps

set.seed(1)
for (way in c("internal", "blas", "default", "default.simd")) {
  options(matprod = way)
  for (n in c(1, 2, 3, 5, 8, 17, 40)) for (special in list(NULL, NaN, NA_real_, Inf, -Inf)) {
    x <- matrix(runif(n * n) + 0.5, n)
    y <- matrix(runif(n * n) + 0.5, n)
    if (!is.null(special)) x[sample(n, 1), sample(n, 1)] <- special
    id <- paste(way, n, if (is.null(special)) "finite" else special)
    same <- function(name, got, want) {
      check(paste(name, id), identical(kind(c(got)), kind(c(want))))
      f <- is.finite(want)
      check(paste("value of", name, id), all(abs(got[f] - want[f]) <= bound(n) * abs(want[f])))
    }
    same("x %*% y", x %*% y, plain(x, y))
    same("y %*% x", y %*% x, plain(y, x))
    same("crossprod", crossprod(x, y), plain(t(x), y))
    same("crossprod of one", crossprod(x), plain(t(x), x))
    same("tcrossprod", tcrossprod(x, y), plain(x, t(y)))
    same("tcrossprod of one", tcrossprod(x), plain(x, t(x)))
    same("matrix by vector", x %*% y[, 1], plain(x, y[, 1, drop = FALSE]))
    same("vector by matrix", y[1, ] %*% x, plain(y[1, , drop = FALSE], x))
    # A zero does not hide what is no number.
    zero <- matrix(0, n, n)
    same("x %*% 0", x %*% zero, plain(x, zero))
    same("0 %*% x", zero %*% x, plain(zero, x))
    cx <- x + 1i * y
    check(paste("complex", id), identical(is.finite(cx %*% cx), matrix(is.finite(c(plain(cx, cx))), n)))
  }
}
options(matprod = "default")
for (n in c(1, 5, 30, 200)) {
  a <- matrix(rnorm(n * n), n) + diag(n, n)
  b <- matrix(rnorm(n * 3), n)
  residual <- function(m, x) max(abs(m %*% x - b)) / (max(abs(m)) * max(abs(x)) * n)
  check(paste("solve", n), residual(a, solve(a, b)) <= bound(n))
  u <- a * upper.tri(a, TRUE)
  l <- a * lower.tri(a, TRUE)
  check(paste("backsolve", n), residual(u, backsolve(u, b)) <= bound(n))
  check(paste("forwardsolve", n), residual(l, forwardsolve(l, b)) <= bound(n))
  check(paste("transposed backsolve", n), residual(t(u), backsolve(u, b, transpose = TRUE)) <= bound(n))
  s <- crossprod(a)
  check(paste("chol", n), max(abs(crossprod(chol(s)) - s)) <= bound(n) * max(abs(s)))
  check(paste("qr", n), max(abs(qr.Q(qr(a, LAPACK = TRUE)) %*% qr.R(qr(a, LAPACK = TRUE)) -
    a[, qr(a, LAPACK = TRUE)$pivot])) <= bound(n) * n * max(abs(a)))
  e <- eigen(s, symmetric = TRUE)
  check(paste("eigen", n), max(abs(s %*% e$vectors - e$vectors %*% diag(e$values, n))) <= bound(n) * n * max(abs(s)))
  d <- svd(a)
  check(paste("svd", n), max(abs(d$u %*% diag(d$d, n) %*% t(d$v) - a)) <= bound(n) * n * max(abs(a)))
}
# A triangular solve passes on what is no number.
for (special in c(NaN, Inf)) {
  u <- diag(4) + upper.tri(diag(4))
  b <- c(1, 2, special, 1)
  check(paste("backsolve passes", special), !any(is.finite(backsolve(u, b)[1:3])))
}
cat("count ", count, "\n", sep = "")
