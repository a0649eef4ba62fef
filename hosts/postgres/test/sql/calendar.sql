-- Every date from 0001-01-01 to 9999-12-31: the week, day and quarter
-- numbers and the Julian day agree with PostgreSQL's own.
SELECT count(*) AS days,
       count(*) FILTER (WHERE sysfun.week_iso(d) <> extract(week FROM d)) AS week_iso,
       count(*) FILTER (WHERE sysfun.dayofweek_iso(d) <> extract(isodow FROM d)) AS dayofweek_iso,
       count(*) FILTER (WHERE sysfun.dayofyear(d) <> extract(doy FROM d)) AS dayofyear,
       count(*) FILTER (WHERE sysfun.quarter(d) <> extract(quarter FROM d)) AS quarter,
       count(*) FILTER (WHERE sysfun.julian_day(d) <> to_char(d, 'J')::int) AS julian_day
  FROM generate_series(date '0001-01-01', date '9999-12-31', interval '1 day') AS g(t),
       LATERAL (SELECT t::date AS d) AS s;
