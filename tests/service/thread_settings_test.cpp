// What the thread variables of the environment say, by the edge cases of their grammar and against an independent
// transcription of it on random texts.

#include "service/thread_settings.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>

#include "tests/platform/fake.h"
#include "tests/service/environment_transcription.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size);

namespace qtb {

void PrintTo(const ThreadSettings &s, std::ostream *out) {
  *out << "all " << s.threads_all << " blas " << s.threads_blas << " fft " << s.threads_fft << " vml " << s.threads_vml
       << " dynamic " << s.dynamic << " omp " << s.omp_threads_env << " ranks " << s.mpi_procs_per_node << " level "
       << s.mpi_thread_level;
}

namespace test {
namespace {

ThreadSettings read(const Environment &environment) {
  fake.environment = environment;
  fake.environment_reads.clear();
  ThreadSettings settings;
  read_thread_variables(&settings);
  return settings;
}

std::int32_t threads_all(const char *text) { return read({{"QTB_NUM_THREADS", text}}).threads_all; }
ThreadSettings domains(const char *text) { return read({{"QTB_DOMAIN_NUM_THREADS", text}}); }
std::int32_t threads_blas(const char *text) { return domains(text).threads_blas; }
std::int32_t dynamic(const char *text) { return read({{"QTB_DYNAMIC", text}}).dynamic; }
std::int32_t omp_threads(const char *text) { return read({{"OMP_NUM_THREADS", text}}).omp_threads_env; }
std::int32_t ranks(const char *text) {
  return read({{"Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", text}}).mpi_procs_per_node;
}
std::int32_t level(const char *text) { return read({{"Q_MPI_THREAD_LEVEL", text}}).mpi_thread_level; }

TEST(ThreadVariables, AreReadOnceEachInTheirOrder) {
  read({});
  const std::vector<std::string> order = {"QTB_NUM_THREADS",
                                          "QTB_DOMAIN_NUM_THREADS",
                                          "QTB_DYNAMIC",
                                          "OMP_NUM_THREADS",
                                          "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE",
                                          "Q_MPI_THREAD_LEVEL"};
  EXPECT_EQ(fake.environment_reads, order);
}

TEST(ThreadVariables, AnEmptyEnvironmentMeansDynamicModeAndNothingGiven) {
  ThreadSettings initial;
  initial.dynamic = 1;
  EXPECT_EQ(read({}), initial);
}

TEST(NumThreads, IsANumberOfDigits) {
  EXPECT_EQ(threads_all("4"), 4);
  EXPECT_EQ(threads_all("007"), 7);
  EXPECT_EQ(threads_all("2147483647"), 2147483647);
}

TEST(NumThreads, ZeroIsIgnored) {
  EXPECT_EQ(threads_all("0"), -1);
  EXPECT_EQ(threads_all("000"), -1);
}

TEST(NumThreads, AMalformedValueMeansOne) {
  for (const char *text : {"abc", "-2", "+2", " 4", "4 ", "4,2", "0x4", "4.0", "\t4", "-0"})
    EXPECT_EQ(threads_all(text), 1) << text;
}

TEST(NumThreads, ANumberBeyond32BitsIsAtois) {
  for (const char *text : {"2147483648", "4294967296", "4294967299", "99999999999999999999"}) {
    const int number = std::atoi(text);
    EXPECT_EQ(threads_all(text), number >= 1 ? number : -1) << text;
  }
}

TEST(NumThreads, AValueOf256CharactersIsAbsent) {
  const std::string fits = std::string(254, '0') + "7", too_long = std::string(255, '0') + "7";
  EXPECT_EQ(threads_all(fits.c_str()), 7);
  EXPECT_EQ(threads_all(too_long.c_str()), -1);
  EXPECT_EQ(threads_all(std::string(300, 'x').c_str()), -1);
}

TEST(DomainNumThreads, EveryKeyHasItsField) {
  const ThreadSettings s = domains("QTB_ALL=2,QTB_BLAS=3,QTB_FFT=4,QTB_VML=5");
  EXPECT_EQ(s.threads_all, 2);
  EXPECT_EQ(s.threads_blas, 3);
  EXPECT_EQ(s.threads_fft, 4);
  EXPECT_EQ(s.threads_vml, 5);
}

TEST(DomainNumThreads, NumThreadsBeatsTheKeyForAll) {
  const ThreadSettings s = read({{"QTB_NUM_THREADS", "6"}, {"QTB_DOMAIN_NUM_THREADS", "QTB_ALL=2, QTB_BLAS=3"}});
  EXPECT_EQ(s.threads_all, 6);
  EXPECT_EQ(s.threads_blas, 3);
  EXPECT_EQ(read({{"QTB_NUM_THREADS", "0"}, {"QTB_DOMAIN_NUM_THREADS", "QTB_ALL=2"}}).threads_all, 2);
}

TEST(DomainNumThreads, AnEmptyOrMalformedNumberIsOne) {
  for (const char *text : {"QTB_BLAS=", "QTB_BLAS", "QTB_BLAS= ", "QTB_BLAS=,", "QTB_BLAS=x", "QTB_BLAS=-3",
                           "QTB_BLAS=3x", "QTB_BLAS=\"3\"", "QTB_BLAS'=3", "QTB_BLAS=,3"})
    EXPECT_EQ(threads_blas(text), 1) << text;
}

TEST(DomainNumThreads, ZeroLeavesADomainUnset) {
  EXPECT_EQ(threads_blas("QTB_BLAS=0"), -1);
  EXPECT_EQ(threads_blas("QTB_BLAS=0,QTB_BLAS=4"), 4);
}

TEST(DomainNumThreads, TheFirstOfTwoEntriesWins) { EXPECT_EQ(threads_blas("QTB_BLAS=2,QTB_BLAS=5"), 2); }

TEST(DomainNumThreads, KeysAreComparedWholeAndCaseCounts) {
  for (const char *text : {"qtb_blas=2", "QTB_BLA=2", "QTB_BLASS=2", "BLAS=2", "Qtb_BLAS=2"})
    EXPECT_EQ(threads_blas(text), -1) << text;
}

TEST(DomainNumThreads, SeparatorsMayStandAroundAnEntry) {
  for (const char *text : {"'QTB_BLAS=2'", "\"QTB_BLAS=2\"", " ,;:'\"QTB_BLAS=2", "QTB_BLAS 2", "QTB_BLAS = 2",
                           "QTB_BLAS== = 2", "X=1;QTB_BLAS=2", "X=1:QTB_BLAS=2", "X=1 QTB_BLAS=2", "X=1,,QTB_BLAS=2;"})
    EXPECT_EQ(threads_blas(text), 2) << text;
}

TEST(DomainNumThreads, CommaSemicolonAndColonDoNotEndAKey) {
  EXPECT_EQ(threads_blas("X,QTB_BLAS=2"), -1);
  EXPECT_EQ(threads_blas("X;QTB_BLAS=2"), -1);
  EXPECT_EQ(threads_blas("X:QTB_BLAS=2"), -1);
  EXPECT_EQ(threads_blas("X QTB_BLAS=2"), -1);  // QTB_BLAS=2 is X's number
}

TEST(DomainNumThreads, AnEmptyKeyEndsTheScan) {
  EXPECT_EQ(threads_blas("=3,QTB_BLAS=2"), -1);
  EXPECT_EQ(threads_blas("X=1,=,QTB_BLAS=2"), -1);
}

TEST(DomainNumThreads, AValueOf256CharactersIsAbsent) {
  const std::string entry = "QTB_BLAS=2";
  EXPECT_EQ(threads_blas((entry + std::string(245, ' ')).c_str()), 2);
  EXPECT_EQ(threads_blas((entry + std::string(246, ' ')).c_str()), -1);
}

TEST(Dynamic, OnlyTheTwoSpellingsOfFalseTurnItOff) {
  for (const char *text : {"FALSE", "false", " FALSE", "\"false\"", "'FALSE' x", " \"' false\"TRUE", "FALSE "})
    EXPECT_EQ(dynamic(text), 0) << text;
  for (const char *text : {"False", "0", "no", "FALSEX", "xFALSE", "TRUE", " ", "FALSE,", "\tFALSE", "", "FALS"})
    EXPECT_EQ(dynamic(text), 1) << text;
}

TEST(Dynamic, AValueOf256CharactersIsAbsent) {
  EXPECT_EQ(dynamic(("FALSE" + std::string(250, ' ')).c_str()), 0);
  EXPECT_EQ(dynamic(("FALSE" + std::string(251, ' ')).c_str()), 1);
}

TEST(OmpNumThreads, IsNotedAsGiven) {
  EXPECT_EQ(omp_threads("6"), 6);
  EXPECT_EQ(omp_threads("0"), -1);
  EXPECT_EQ(omp_threads("4,2"), 1);
  EXPECT_EQ(omp_threads("-1"), 1);
}

TEST(MpiRanks, AreAPositiveNumberOrNotGiven) {
  EXPECT_EQ(ranks("2"), 2);
  for (const char *text : {"0", "-2", "two", "2 ", " 2", "+2"}) EXPECT_EQ(ranks(text), -1) << text;
}

TEST(MpiThreadLevel, IsZeroToThreeAndZeroForEverythingElseGiven) {
  EXPECT_EQ(level("0"), 0);
  EXPECT_EQ(level("1"), 1);
  EXPECT_EQ(level("2"), 2);
  EXPECT_EQ(level("3"), 3);
  for (const char *text : {"4", "-1", "x", " 3", "33", "3,"}) EXPECT_EQ(level(text), 0) << text;
  EXPECT_EQ(level(""), -1);
}

template <std::size_t n>
const char *any(std::mt19937 &random, const char *const (&of)[n]) {
  return of[random() % n];
}

// Half the texts are entries of the grammar, the others loose pieces of it; some characters of either are changed.
std::string random_text(std::mt19937 &random) {
  static const char *const keys[] = {"QTB_ALL", "QTB_BLAS", "QTB_FFT", "QTB_VML", "qtb_blas", "QTB", "X"};
  static const char *const signs[] = {"=", "=", "=", " = ", "==", " ", "= ", "'=", ""};
  static const char *const numbers[] = {"0", "1", "3", "12", "007", "-3", "+3", "x", "", "4294967299", "2147483648"};
  static const char *const separators[] = {",", ";", ":", " ", ", ", "\"", "'", "", "\t"};
  static const char *const words[] = {"FALSE", "false", "False", "_", "\n"};
  std::string text;
  const bool entries = random() % 2 == 0;
  for (std::size_t i = random() % (random() % 16 == 0 ? 40 : 5); i > 0; --i) {
    if (entries)
      text = text + any(random, keys) + any(random, signs) + any(random, numbers) + any(random, separators);
    else
      switch (random() % 5) {
        case 0: text += any(random, keys); break;
        case 1: text += any(random, signs); break;
        case 2: text += any(random, numbers); break;
        case 3: text += any(random, separators); break;
        default: text += any(random, words); break;
      }
  }
  if (!text.empty() && random() % 4 == 0) text[random() % text.size()] = static_cast<char>(1 + random() % 255);
  return text;
}

TEST(ThreadVariables, AgreeWithAnIndependentTranscriptionOnRandomTexts) {
  std::mt19937 random(20240611);
  const int cases = std::getenv("QTB_TEST_LONG") != nullptr ? 20'000'000 : 200'000;
  int given = 0;
  for (int i = 0; i < cases; ++i) {
    Environment environment;
    for (const char *name : {"QTB_NUM_THREADS", "QTB_DOMAIN_NUM_THREADS", "QTB_DYNAMIC", "OMP_NUM_THREADS",
                             "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "Q_MPI_THREAD_LEVEL"})
      if (std::string text = random_text(random); !text.empty()) environment[name] = text;
    const ThreadSettings want = transcribed_settings(environment);
    given += want.threads_blas > 1;
    ASSERT_EQ(read(environment), want) << testing::PrintToString(environment);
  }
  std::printf("%d random environments, %d of them with a number for this library\n", cases, given);
  EXPECT_GT(given, cases / 100) << "the texts hardly ever reach the grammar";
}

TEST(ThreadVariables, TheCorpusReplays) {
  int files = 0;
  for (const auto &file : std::filesystem::directory_iterator(QTB_TEST_CORPUS "/environment")) {
    std::ifstream in(file.path(), std::ios::binary);
    const std::string bytes(std::istreambuf_iterator<char>(in), {});
    LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t *>(bytes.data()), bytes.size());
    ++files;
  }
  EXPECT_GE(files, 10);
}

}  // namespace
}  // namespace test
}  // namespace qtb
