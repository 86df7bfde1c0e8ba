% Runs Octave's built-in tests of its functions of linear algebra, then solves problems of its own and checks their
% residuals, in units of the precision times the order. Prints "failed NAME" for each failure, "count N" at the end.
count = 0;
functions = {"balance", "chol", "cholinv", "chol2inv", "cholupdate", "det", "dot", "eig", "expm", "gsvd", ...
             "givens", "hess", "inv", "kron", "logm", "lu", "mgorth", "null", "orth", "ordschur", "pinv", "qr", ...
             "qz", "rank", "rcond", "schur", "sqrtm", "svd", "sylvester", "trace", "cond", "cross", "housh", "krylov", ...
             "linsolve", "lscov", "mtimes", "mldivide", "norm", "normest", "planerot", "qzhess", "subspace", ...
             "condest", "condeig", "gls", "ols", "lsqnonneg", "pcg", "gmres", "bicg"};
for k = 1:numel (functions)
  [passed, tests] = test (functions{k}, "quiet");
  count += tests;
  if (passed != tests)
    printf ("failed %s: %d of %d\n", functions{k}, tests - passed, tests);
  end
end

function close_to_zero (name, residual, scale, n, type)
  bound = 30 * n * eps (type);
  if (! (residual / scale <= bound))
    printf ("failed residual of %s, %s, order %d: %g\n", name, type, n, residual / scale);
  end
end

for type = {"double", "single"}
  for n = [1, 3, 17, 64, 200]
    for complex_too = [false, true]
      a = cast (rand (n), type{1}) - 0.5;
      if (complex_too)
        a += 1i * (cast (rand (n), type{1}) - 0.5);
      end
      b = a(:, 1:min (n, 5)) + 1;
      s = norm (a, 1);
      x = a \ b;
      close_to_zero ("mldivide", norm (a * x - b, 1), s * norm (x, 1), n, type{1});
      [l, u, p] = lu (a);
      close_to_zero ("lu", norm (p * a - l * u, 1), s, n, type{1});
      [q, r] = qr (a);
      close_to_zero ("qr", norm (a - q * r, 1), s, n, type{1});
      close_to_zero ("orthogonality of qr", norm (q' * q - eye (n), 1), 1, n, type{1});
      h = a * a' + n * eye (n);
      c = chol (h);
      close_to_zero ("chol", norm (h - c' * c, 1), norm (h, 1), n, type{1});
      [v, w] = eig (h);
      close_to_zero ("eig", norm (h * v - v * w, 1), norm (h, 1), n, type{1});
      [u, w, v] = svd (a);
      close_to_zero ("svd", norm (a - u * w * v', 1), s, n, type{1});
      y = triu (h) \ b;
      close_to_zero ("triangular solve", norm (triu (h) * y - b, 1), norm (h, 1) * norm (y, 1), n, type{1});
      count += 8;
    end
  end
end
printf ("count %d\n", count);
