#include "error/report_lucene_errors.h"

#include <lucene++/LuceneHeaders.h>

#include <exception>
#include <iostream>

void ReportLuceneErrors(const std::function<void()>& body) {
  try {
    body();
  } catch (const Lucene::LuceneException& error) {
    std::wcout << L"LuceneException: " << error.getError() << std::endl;
  } catch (const std::exception& error) {
    std::cout << "Exception:" << error.what() << std::endl;
  }
}
