"""The embedded default: the sessions on this machine's cores, one replay process at a time
per worker thread (the threads only wait on their process)."""
import concurrent.futures

from velmora_fleet.session_run import run_session


def run_local(jobs, workers, on_done):
    """The results of run_session for every job, in no particular order."""
    results = []
    with concurrent.futures.ThreadPoolExecutor(max_workers=workers) as pool:
        futures = [pool.submit(run_session, job) for job in jobs]
        try:
            for future in concurrent.futures.as_completed(futures):
                results.append(future.result())
                on_done()
        except KeyboardInterrupt:
            for future in futures:
                future.cancel()
            raise
    return results
