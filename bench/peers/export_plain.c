/* export_plain.c - the export as a plain C program would do it: fseek, fread,
 * fprintf and the C library's number formatting.  A peer of the benchmark,
 * with the tool's output byte for byte; usage: export_plain DIR OUT.csv
 *
 * It takes well-made tables only: little-endian machine, good heads, known
 * record types, no line ends inside a text, no direction marks without
 * letters, dates within the calendar. */
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

enum { RECORD = 1259, TEXT = 65 };

static unsigned char record[RECORD + 1];

static int is_digit(int c) { return c >= '0' && c <= '9'; }
static int is_latin(int c) {
  return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z');
}
static int is_hebrew(int c) { return c >= 224 && c <= 250; }
static int is_strong(int c) {
  return is_latin(c) || is_hebrew(c) || c == 253 || c == 254;
}
static int is_rtl(int c) { return is_hebrew(c) || c == 254; }

static int mirrored(int c) {
  static const char pairs[] = "()[]{}";
  const char *p = c ? strchr(pairs, c) : NULL;
  return p ? pairs[(p - pairs) ^ 1] : c;
}

/* The run at the start of text; its direction, its length in *length. */
static int split_run(const unsigned char *text, int n, int *length) {
  int strong = 0, rtl, end;
  while (strong < n && !is_strong(text[strong])) ++strong;
  if (strong == n) return *length = n, 1;
  rtl = is_rtl(text[strong]);
  if (!rtl && strong > 0) return *length = strong, 1;
  for (end = strong; end < n; ++end)
    if (is_strong(text[end]) && is_rtl(text[end]) != rtl) break;
  if (!rtl)
    while (end > 0 && !is_latin(text[end - 1])) --end;
  *length = end;
  return rtl;
}

static int reverse_run(unsigned char *out, const unsigned char *run, int n) {
  int i, written = 0;
  for (i = n - 1; i >= 0; --i) {
    int first = i;
    if (run[i] == 254) continue;
    if (!is_digit(run[i]) &&
        !(run[i] == '%' && i > 0 && is_digit(run[i - 1]))) {
      out[written++] = (unsigned char)mirrored(run[i]);
      continue;
    }
    while (first > 0 &&
           (is_digit(run[first - 1]) ||
            (strchr(",/:+-.$", run[first - 1]) && run[first - 1] && first > 1 &&
             is_digit(run[first - 2]))))
      --first;
    if (first > 1 && run[first - 1] == '$') --first;
    if (written > 0 && out[written - 1] == '$' && is_digit(run[first]))
      out[written++] = 254;
    memcpy(out + written, run + first, (size_t)(i - first + 1));
    written += i - first + 1;
    i = first;
  }
  return written;
}

/* Converts one line in place of the front of out; returns its length. */
static int logical(unsigned char *out, const unsigned char *text, int n) {
  unsigned char piece[2 * RECORD + 2];
  int done = 0;
  while (n > 0) {
    int length, i, size;
    const int rtl = split_run(text, n, &length);
    if (length == 0) abort();
    if (rtl) {
      size = reverse_run(piece, text, length);
    } else {
      memcpy(piece, text, (size_t)length);
      size = length;
      for (i = 0; i < done && !is_digit(out[i]) && !is_hebrew(out[i]); ++i) {
      }
      if (i < done && is_digit(out[i])) piece[size++] = 254;
    }
    memmove(out + size, out, (size_t)done);
    memcpy(out, piece, (size_t)size);
    done += size;
    text += length;
    n -= length;
  }
  return done;
}

static void print_text(FILE *out, const unsigned char *field) {
  unsigned char line[RECORD], result[2 * RECORD + 2];
  int i, n = 0, size;
  for (; *field; ++field)
    line[n++] = (unsigned char)(*field >= 128 && *field <= 154 ? *field + 96
                                                              : *field);
  size = logical(result, line, n);
  for (i = 0; i < size; ++i) {
    const int c = result[i], code = c - 224 + 0x5D0;
    if (c == '"' || c == ',') continue;
    if (c < 128)
      putc(c, out);
    else if (code <= 0x5EA)
      fprintf(out, "%c%c", 0xC0 | code >> 6, 0x80 | (code & 0x3F));
  }
}

static double decode(int32_t w) {
  static const double scales[4] = {0.0001, 0.000001, 0.00000001, 1000};
  if ((w & 1) == 0) return w >> 1;
  if ((w & 3) == 3)
    return (w >> 2) % 100 == 0 ? (w >> 2) * 0.01 * 0.015625 : (w >> 2) * 0.01;
  return (w >> 4) * scales[(w >> 2) & 3];
}

static void print_number(FILE *out, int i) {
  char text[40];
  int32_t word;
  char *exponent;
  memcpy(&word, record + 589 + 4 * i, 4);
  snprintf(text, sizeof text, "%.15g", decode(word));
  exponent = strchr(text, 'e');
  if (exponent && strlen(exponent) == 4)
    fprintf(out, "%.*s0%s", (int)(exponent + 2 - text), text, exponent + 2);
  else
    fputs(text, out);
}

static void print_date(FILE *out, int i) {
  static const int starts[12] = {0,   31,  59,  90,  120, 151,
                                 181, 212, 243, 273, 304, 334};
  int16_t days;
  int rest, year, month = 11;
  memcpy(&days, record + 801 + 2 * i, 2);
  year = 1970 + days / 1461 * 4;
  rest = days % 1461;
  while (rest >= (year % 4 ? 365 : 366)) rest -= year++ % 4 ? 365 : 366;
  while (starts[month] + (year % 4 == 0 && month >= 2) > rest) --month;
  fprintf(out, "%02d-%02d-%02d",
          rest - starts[month] - (year % 4 == 0 && month >= 2) + 1, month + 1,
          year % 100);
}

static void print_row(FILE *out) {
  static const int texts[] = {1, 2, 8, 3, 4, 5, 6, 7};
  int i;
  int16_t type;
  memcpy(&type, record + 2, 2);
  print_number(out, 0);
  fputs(", ", out);
  print_text(out, record + 4);
  fprintf(out, ", %c", "BIR"[type]);
  for (i = 0; i < 8; ++i) {
    fputs(", ", out);
    print_text(out, record + 4 + TEXT * texts[i]);
  }
  fputs(", ", out);
  print_number(out, 49);
  fputs(", ", out);
  print_number(out, 52);
  for (i = 1; i <= 48; ++i) {
    fputs(", ", out);
    print_number(out, i);
  }
  for (i = 50; i <= 51; ++i) {
    fputs(", ", out);
    print_number(out, i);
  }
  for (i = 0; i < 12; ++i) {
    fputs(", ", out);
    print_date(out, i);
  }
  putc('\n', out);
}

static FILE *open_in(const char *directory, const char *name,
                     const char *mode) {
  char path[4096];
  FILE *file;
  snprintf(path, sizeof path, "%s/%s", directory, name);
  file = fopen(path, mode);
  if (!file) exit(1);
  return file;
}

int main(int argc, char **argv) {
  unsigned char head[6], entry[24];
  FILE *index, *data, *out;
  int code;
  if (argc != 3) return 2;
  index = open_in(argv[1], "D4WVTX.IDX", "rb");
  data = open_in(argv[1], "D4WVTX.BIN", "rb");
  out = fopen(argv[2], "wb");
  if (!out || fread(head, 6, 1, index) != 1) return 1;
  fputs("seccode, ", out);
  for (code = 37424; code <= 37498; ++code)
    if (code != 37436) fprintf(out, code < 37498 ? "%d, " : "%d\r\n\r\n", code);
  while (fread(entry, 24, 1, index) == 1) {
    int32_t offset;
    memcpy(&offset, entry + 20, 4);
    if (offset == -1 || fseek(data, offset, SEEK_SET) != 0 ||
        fread(record, RECORD, 1, data) != 1 || record[4 + TEXT] == 0)
      continue;
    print_row(out);
  }
  return fclose(out) == 0 ? 0 : 1;
}
